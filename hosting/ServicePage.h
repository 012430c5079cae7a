// The service page: one action for each request, selected by the deciphered ClientAction.
#pragma once

#include <string>

#include "hosting/FormBody.h"
#include "hosting/LogNote.h"
#include "hosting/Options.h"
#include "hosting/Store.h"
#include "transfer/Reply.h"

namespace tarnwick::hosting {

class ServicePage {
 public:
  // Both must outlive the page.
  ServicePage(Store& store, const Options& options) : store_(store), options_(options) {}

  // The deciphered action word of a request's form; empty when the form is malformed or has none that is
  // known.
  static std::string ActionOf(const Reply& form);

  // Carries the action out; what is malformed or names an unknown user or action gets an answer that says so.
  // `server`, such as "http://HOST:PORT", goes into file addresses. Failures of disk or database throw.
  FormBody Answer(const std::string& action, const Reply& form, const std::string& server,
                  LogNote& note) const;

 private:
  Store& store_;
  const Options& options_;
};

}  // namespace tarnwick::hosting
