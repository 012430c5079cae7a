// The one exception type of the core. Nothing leaves the library as an exception: every public operation
// catches at its entry, either through ResultAsItStood or in a handler of its own.
#pragma once

#include <cstdint>
#include <exception>
#include <utility>

namespace tarnwick {

// Numbers of the run-time errors that hosts know from automation.
namespace error {
inline constexpr std::int32_t kInvalidCall = 5;
inline constexpr std::int32_t kOverflow = 6;
inline constexpr std::int32_t kSubscriptOutOfRange = 9;
inline constexpr std::int32_t kDivisionByZero = 11;
inline constexpr std::int32_t kTypeMismatch = 13;
inline constexpr std::int32_t kInterrupted = 18;
inline constexpr std::int32_t kFileNotFound = 53;
inline constexpr std::int32_t kFileAlreadyExists = 58;
inline constexpr std::int32_t kPathAccess = 75;
inline constexpr std::int32_t kPathNotFound = 76;
inline constexpr std::int32_t kResourceNotFound = 326;
inline constexpr std::int32_t kNoSuchMember = 438;
inline constexpr std::int32_t kDuplicateKey = 457;
inline constexpr std::int32_t kInvalidFormat = 461;
}  // namespace error

class RuntimeError : public std::exception {
 public:
  explicit RuntimeError(std::int32_t number) : number_(number) {}

  // One of the numbers above, or the HRESULT with which a component reported its failure.
  std::int32_t Number() const { return number_; }
  const char* what() const noexcept override { return "run-time error"; }

 private:
  std::int32_t number_;
};

// Runs body(result), which may assign its result at any point, and returns the result as it stood when the
// body ended, normally or through an exception of any kind.
template <typename Result, typename Body>
Result ResultAsItStood(Result result, Body&& body) noexcept {
  try {
    std::forward<Body>(body)(result);
  } catch (...) {
    // Failures are told by the result alone; a host sees no error.
  }
  return result;
}

}  // namespace tarnwick
