// What the printed line tells of a request; never a password or a key.
#pragma once

#include <string>
#include <string_view>

namespace tarnwick::hosting {

struct LogNote {
  std::string method;
  std::string path;
  std::string action;
  std::string user;
  std::string result;
};

// `text` on one line: other bytes than printable ASCII and UTF-8 become "?", and a long text is cut.
std::string Printable(std::string_view text);

}  // namespace tarnwick::hosting
