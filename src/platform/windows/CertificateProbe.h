// What is wrong with a server's certificate. Wine: only its older HTTP client tells it.
#pragma once

#include <cstdint>
#include <functional>

#include "base/Text.h"

namespace tarnwick {

// How long an answer is waited for.
inline constexpr std::uint32_t kProbeMs = 5'000;

// Connects to the server once more and calls `told` with the http_error that stands against its certificate,
// kSecureChannel when none does, on a thread of the system's pool. Nothing of a user goes to the server. It
// may take for ever; false when it could not begin.
bool ProbeCertificate(const Text& host, std::uint16_t port, std::function<void(std::int32_t)> told);

// The same, waited for; kSecureChannel when it takes too long.
std::int32_t ProbedCertificate(const Text& host, std::uint16_t port);

}  // namespace tarnwick
