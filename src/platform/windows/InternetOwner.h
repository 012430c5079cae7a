// A handle of the system's Internet functions, and the time-outs that all of ours have.
#pragma once

#include <cstdint>

#include "platform/windows/InternetHeaders.h"
#include "platform/windows/Owner.h"

namespace tarnwick {

using InternetOwner = Owner<HINTERNET, InternetCloseHandle>;

// Sets the time-outs, in milliseconds, of a session, which what it opens inherits. A version of the system
// that lacks one of them ignores it; then a peer that never answers the connection costs what TCP itself
// takes to give up.
inline void SetTimeouts(HINTERNET handle, std::uint32_t connectMs, std::uint32_t silenceMs) {
  const auto set = [&](DWORD option, DWORD value) {
    InternetSetOptionW(handle, option, &value, sizeof value);
  };
  set(INTERNET_OPTION_CONNECT_TIMEOUT, connectMs);
  // Or the connect time-out is taken several times over.
  set(INTERNET_OPTION_CONNECT_RETRIES, 1);
  set(INTERNET_OPTION_SEND_TIMEOUT, silenceMs);
  set(INTERNET_OPTION_RECEIVE_TIMEOUT, silenceMs);
  set(INTERNET_OPTION_DATA_SEND_TIMEOUT, silenceMs);
  set(INTERNET_OPTION_DATA_RECEIVE_TIMEOUT, silenceMs);
}

}  // namespace tarnwick
