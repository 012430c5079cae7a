// Reads a multipart/form-data body as it arrives, in constant memory. cpp-httplib's own reader matches the
// lines of a part with recursive regular expressions, which a long line makes run out of stack.
#pragma once

#include <functional>
#include <optional>
#include <string>
#include <string_view>

namespace tarnwick::hosting {

class MultipartReader {
 public:
  struct Part {
    std::string name;
    std::optional<std::string> fileName;  // as it was sent
  };

  // The boundary that a Content-Type value names; nullopt when it is another type or names none.
  static std::optional<std::string> BoundaryOf(std::string_view contentType);

  // `begin` is called for each part, then `content` with its bytes, piece by piece. Each answers false to
  // stop.
  MultipartReader(std::string_view boundary, std::function<bool(const Part&)> begin,
                  std::function<bool(std::string_view)> content);

  // Takes the next bytes of the body. False, now and from then on, when they are malformed or a callback
  // stopped.
  bool Take(std::string_view bytes);

  // Whether the closing boundary has come.
  bool IsComplete() const { return state_ == State::kEnd; }

 private:
  enum class State { kPreamble, kContent, kAfterBoundary, kHeaders, kEnd, kFailed };

  // Each advances by what it finds in the buffer; false when it needs more bytes.
  bool TakeContent();
  bool TakeAfterBoundary();
  bool TakeHeaders();

  std::string delimiter_;
  std::function<bool(const Part&)> begin_;
  std::function<bool(std::string_view)> content_;
  std::string buffer_ = "\r\n";  // the first boundary needs no line end before it
  std::size_t position_ = 0;     // of the first byte of the buffer that is not dealt with
  State state_ = State::kPreamble;
};

}  // namespace tarnwick::hosting
