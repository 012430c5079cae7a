#include "hosting/Multipart.h"

#include <algorithm>
#include <cctype>

namespace tarnwick::hosting {
namespace {

constexpr std::size_t kLongestBoundary = 70;
constexpr std::size_t kLongestHeaders = 8 * 1024;

bool StartsWithIgnoringCase(std::string_view text, std::string_view start) {
  return text.size() >= start.size() &&
         std::equal(start.begin(), start.end(), text.begin(), [](char one, char other) {
           return one == std::tolower(static_cast<unsigned char>(other));
         });
}

std::string_view WithoutBlanks(std::string_view text) {
  const std::size_t first = text.find_first_not_of(" \t");
  if (first == std::string_view::npos) return {};
  return text.substr(first, text.find_last_not_of(" \t") - first + 1);
}

// Value of a parameter, quoted or not, in "type; name=value; name=value". Inside quotes a backslash is a
// character like others: file names hold it, and no sender here escapes with it.
std::optional<std::string> Parameter(std::string_view header, std::string_view name) {
  std::size_t at = header.find(';');
  while (at < header.size()) {
    const std::size_t equals = header.find('=', at);
    if (equals == std::string_view::npos) return std::nullopt;
    const std::string_view found = WithoutBlanks(header.substr(at + 1, equals - at - 1));
    std::string_view value = header.substr(equals + 1);
    std::size_t end = value.find(';');
    if (value.starts_with('"')) {
      const std::size_t quote = value.find('"', 1);
      if (quote == std::string_view::npos) return std::nullopt;
      end = value.find(';', quote);
      value = value.substr(1, quote - 1);
    } else {
      value = WithoutBlanks(value.substr(0, end));
    }
    if (found.size() == name.size() && StartsWithIgnoringCase(found, name)) return std::string(value);
    at = end == std::string_view::npos ? end : equals + 1 + end;
  }
  return std::nullopt;
}

}  // namespace

std::optional<std::string> MultipartReader::BoundaryOf(std::string_view contentType) {
  if (!StartsWithIgnoringCase(contentType, "multipart/form-data")) return std::nullopt;
  auto boundary = Parameter(contentType, "boundary");
  if (!boundary || boundary->empty() || boundary->size() > kLongestBoundary) return std::nullopt;
  return boundary;
}

MultipartReader::MultipartReader(std::string_view boundary, std::function<bool(const Part&)> begin,
                                 std::function<bool(std::string_view)> content)
    : delimiter_(std::string("\r\n--").append(boundary)),
      begin_(std::move(begin)),
      content_(std::move(content)) {}

bool MultipartReader::Take(std::string_view bytes) {
  buffer_.append(bytes);
  bool advances = true;
  while (advances) {
    switch (state_) {
      case State::kPreamble:
      case State::kContent:
        advances = TakeContent();
        break;
      case State::kAfterBoundary:
        advances = TakeAfterBoundary();
        break;
      case State::kHeaders:
        advances = TakeHeaders();
        break;
      case State::kEnd:
      case State::kFailed:
        position_ = buffer_.size();
        advances = false;
        break;
    }
  }
  buffer_.erase(0, position_);
  position_ = 0;
  return state_ != State::kFailed;
}

bool MultipartReader::TakeContent() {
  const std::string_view rest = std::string_view(buffer_).substr(position_);
  const std::size_t found = rest.find(delimiter_);
  // The last bytes may be the start of a boundary whose end has not come yet.
  const std::size_t sure =
      found != std::string_view::npos ? found : rest.size() - std::min(rest.size(), delimiter_.size() - 1);
  if (state_ == State::kContent && sure > 0 && !content_(rest.substr(0, sure))) {
    state_ = State::kFailed;
    return true;
  }
  position_ += sure;
  if (found == std::string_view::npos) return false;
  position_ += delimiter_.size();
  state_ = State::kAfterBoundary;
  return true;
}

bool MultipartReader::TakeAfterBoundary() {
  const std::string_view rest = std::string_view(buffer_).substr(position_);
  if (rest.size() < 2) return false;
  if (rest.starts_with("--"))
    state_ = State::kEnd;
  else if (rest.starts_with("\r\n"))
    state_ = State::kHeaders;
  else
    state_ = State::kFailed;
  // The line end stays when it also is the one before the empty line that ends the headers.
  if (state_ == State::kEnd) position_ += 2;
  return true;
}

bool MultipartReader::TakeHeaders() {
  constexpr std::string_view kEnd = "\r\n\r\n";
  const std::string_view rest = std::string_view(buffer_).substr(position_);
  const std::size_t end = rest.substr(0, kLongestHeaders).find(kEnd);
  if (end == std::string_view::npos) {
    if (rest.size() < kLongestHeaders) return false;
    state_ = State::kFailed;
    return true;
  }
  std::optional<Part> part;
  std::string_view lines = rest.substr(0, end);
  while (!lines.empty()) {
    const std::string_view line = lines.substr(0, lines.find("\r\n"));
    lines.remove_prefix(std::min(line.size() + 2, lines.size()));
    if (!StartsWithIgnoringCase(line, "content-disposition:")) continue;
    if (const auto name = Parameter(line, "name")) part = Part{*name, Parameter(line, "filename")};
  }
  position_ += end + kEnd.size();
  state_ = part && begin_(*part) ? State::kContent : State::kFailed;
  return true;
}

}  // namespace tarnwick::hosting
