// What is known of one request while it is served.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

namespace tarnwick::hosting {

// The parts of a request's head that decide what happens with it.
struct RequestHead {
  std::string method;
  std::vector<std::string> segments;  // of the path, unescaped; empty ones left out
  std::string path;                   // the segments again, each after a "/"
  std::string hostName;               // value of the Host line
  std::string contentType;
};

// For the printed line; never a password or a key.
struct LogNote {
  std::string action;
  std::string user;
  std::string result;
};

// Reads a target: origin form ("/path?query") or a proxy's absolute form ("http://S/path?query").
void ReadTarget(std::string_view target, RequestHead& head);

// `text` on one line: other bytes than printable ASCII and UTF-8 become "?", and a long text is cut.
std::string Printable(std::string_view text);

}  // namespace tarnwick::hosting
