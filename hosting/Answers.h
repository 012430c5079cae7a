// Fills answers, spoilt by the faults that concern their status and body; the rest are the connection's.
#pragma once

#include <httplib.h>

#include <string_view>
#include <vector>

#include "hosting/Faults.h"
#include "hosting/Files.h"
#include "hosting/FormBody.h"

namespace tarnwick::hosting {

void SetForm(httplib::Response& answer, FormBody form, const std::vector<Fault>& faults);

// The bytes of an open file, read as they are sent.
void SetPicture(httplib::Response& answer, FileHandle file, std::string_view name,
                const std::vector<Fault>& faults);

}  // namespace tarnwick::hosting
