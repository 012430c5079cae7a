// Faults that the server shows on purpose, so that host authors and tests see how a client takes them. Unless
// a fault says otherwise the request is carried out and only its answer is spoilt.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "hosting/FormBody.h"

namespace tarnwick::hosting {

struct Fault {
  enum class Kind {
    kRefuse,          // closed without an answer; nothing is carried out
    kResetRequest,    // reset before the request is read; nothing is carried out
    kResetHead,       // reset in the middle of the answer's head
    kResetBody,       // reset half-way through the answer's body
    kStallHandshake,  // of TLS: nothing is sent until the client goes; for all connections
    kStall,           // nothing is sent for `amount` seconds, or until the client goes
    kDrip,            // one byte each `amount` milliseconds
    kCut,        // closed, without TLS's close-notify, after `amount` bytes, or half, of the announced body
    kWrong,      // variables of other names, or a listing whose sister arrays are shorter
    kGarbage,    // a broken form
    kStatus,     // status `amount`
    kHuge,       // a body of `amount` bytes, or of more than 64 MiB
    kEmpty,      // 200 without a body
    kLength,     // `amount` as the announced length; TLS ends as it should
    kLateClose,  // whole, without a word about the connection, which is closed `amount` ms later, or 20
  };

  std::string where;  // action word, page name, the start of a path with its "/", or "*"
  Kind kind = Kind::kRefuse;
  std::optional<std::uint64_t> amount;
};

// Reads "WHERE=KIND[:ARG]"; nullopt when it is not that.
std::optional<Fault> ParseFault(std::string_view text);

// Those for a whole path: "*", the start of `path`, its last segment.
std::vector<Fault> FaultsForPath(const std::vector<Fault>& faults, std::string_view path);

// Whether TLS's handshake stalls.
bool StallsHandshakes(const std::vector<Fault>& faults);

// Those for an action word.
std::vector<Fault> FaultsForAction(const std::vector<Fault>& faults, std::string_view action);

// What kWrong answers instead of `form`.
FormBody WrongForm(const FormBody& form);

}  // namespace tarnwick::hosting
