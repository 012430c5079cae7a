// Why an exchange with the server had no answer, in the words of m_strLastErrorDesc.
#pragma once

#include <cstdint>

#include "base/Text.h"

namespace tarnwick {

// What keeps a connection over TLS from being safe; empty for an http_error that is none of that.
TextView SecureFailureText(std::int32_t httpError);

}  // namespace tarnwick
