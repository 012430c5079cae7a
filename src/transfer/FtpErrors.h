// Values of the public enumeration FtpErrors that the library sets, as reasons of failures.
#pragma once

#include <cstdint>

namespace tarnwick::ftp_error {

inline constexpr std::int32_t kConnectAborted = 5;
inline constexpr std::int32_t kConnectionRefused = 6;
inline constexpr std::int32_t kConnectionReset = 7;
inline constexpr std::int32_t kHostNotFound = 9;
inline constexpr std::int32_t kNoClient = 24;
inline constexpr std::int32_t kSuccess = 32;
inline constexpr std::int32_t kConnectionLost = 43;
inline constexpr std::int32_t kNotTaken = 44;
inline constexpr std::int32_t kAborted = 45;
inline constexpr std::int32_t kNotLoggedOn = 52;
inline constexpr std::int32_t kNotAllowed = 53;   // by the account
inline constexpr std::int32_t kUnavailable = 54;  // the file, here or there
inline constexpr std::int32_t kFull = 56;
inline constexpr std::int32_t kNameNotAllowed = 57;
inline constexpr std::int32_t kTimeout = 58;
inline constexpr std::int32_t kTransferInProgress = 59;

}  // namespace tarnwick::ftp_error
