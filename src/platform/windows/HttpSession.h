// A session of the system's HTTP client with the user's proxy settings.
#pragma once

#include <string>

#include "platform/windows/HttpRequest.h"

namespace tarnwick {

// A session for one request, which costs little: so a change of the user's proxy settings counts at once.
// `url` is where it goes. Null on failure.
HttpOwner OpenHttpSession(const std::wstring& url);

}  // namespace tarnwick
