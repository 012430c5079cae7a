// The border that no exception crosses.
#pragma once

#include <new>
#include <type_traits>
#include <utility>

#include "support/RuntimeError.h"
#include "support/surface/Automation.h"

namespace tarnwick {

// Runs body(), whose result is the call's; an exception becomes an error code.
template <typename Body>
HRESULT Guarded(Body&& body) noexcept {
  try {
    return std::forward<Body>(body)();
  } catch (const RuntimeError& failure) {
    return ResultFromErrorNumber(failure.Number());
  } catch (const std::bad_alloc&) {
    return E_OUTOFMEMORY;
  } catch (...) {
    return E_UNEXPECTED;
  }
}

// For the operations that tell their failures by their result alone. Runs body(), which assigns *result;
// whatever is thrown meanwhile, the call succeeds with the result as it stood, `neutral` at first.
template <typename Result, typename Body>
HRESULT Answered(Result* result, std::type_identity_t<Result> neutral, Body&& body) noexcept {
  if (!result) return E_POINTER;
  *result = neutral;
  ResultAsItStood(0, [&](int&) { std::forward<Body>(body)(); });
  return S_OK;
}

// The same for a text, which body() returns; empty when it throws.
template <typename Body>
HRESULT AnsweredText(BSTR* result, Body&& body) noexcept {
  return Answered(result, nullptr, [&] { *result = NewBstr(std::forward<Body>(body)()); });
}

// The two methods of a text property that is nothing but `text`.
inline HRESULT GetText(const Text& text, BSTR* value) noexcept {
  if (!value) return E_POINTER;
  *value = nullptr;
  return Guarded([&] {
    *value = NewBstr(text);
    return S_OK;
  });
}
inline HRESULT PutText(Text& text, BSTR value) noexcept {
  return Guarded([&] {
    text = ViewOf(value);
    return S_OK;
  });
}

// Reads a property that is nothing but a number.
template <typename Number>
HRESULT GetNumber(Number number, std::type_identity_t<Number>* value) noexcept {
  if (!value) return E_POINTER;
  *value = number;
  return S_OK;
}

}  // namespace tarnwick
