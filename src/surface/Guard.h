// The border that no exception crosses.
#pragma once

#include <new>
#include <type_traits>
#include <utility>

#include "base/RuntimeError.h"
#include "base/Secret.h"
#include "surface/Automation.h"

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

// The same for a text, which body() returns; empty when it throws. It may be a user's key.
template <typename Body>
HRESULT AnsweredText(BSTR* result, Body&& body) noexcept {
  return Answered(result, nullptr, [&] { *result = NewBstr(Secret(std::forward<Body>(body)())); });
}

// The same for a Boolean, a VARIANT (Empty when it throws) and nothing at all.
template <typename Body>
HRESULT AnsweredBoolean(VARIANT_BOOL* result, Body&& body) noexcept {
  return Answered(result, VARIANT_FALSE, [&] { *result = AutomationBoolean(std::forward<Body>(body)()); });
}

template <typename Body>
HRESULT AnsweredVariant(VARIANT* result, Body&& body) noexcept {
  return Answered(result, VARIANT{}, [&] { *result = std::forward<Body>(body)(); });
}

template <typename Body>
HRESULT Done(Body&& body) noexcept {
  ResultAsItStood(0, [&](int&) { std::forward<Body>(body)(); });
  return S_OK;
}

// The two methods of a text property that is nothing but `text`.
template <typename AnyText>
HRESULT GetText(const AnyText& text, BSTR* value) noexcept {
  if (!value) return E_POINTER;
  *value = nullptr;
  return Guarded([&] {
    *value = NewBstr(Text(text));
    return S_OK;
  });
}
template <typename AnyText>
HRESULT PutText(AnyText& text, BSTR value) noexcept {
  return Guarded([&] {
    text = ViewOf(value);
    return S_OK;
  });
}

// The two methods of a property that is nothing but a number or a Boolean.
template <typename Number>
HRESULT GetNumber(Number number, std::type_identity_t<Number>* value) noexcept {
  if (!value) return E_POINTER;
  *value = number;
  return S_OK;
}
template <typename Number, typename Value>
HRESULT PutNumber(Number& number, Value value) noexcept {
  number = static_cast<Number>(value);
  return S_OK;
}
inline HRESULT GetBoolean(bool boolean, VARIANT_BOOL* value) noexcept {
  return GetNumber<VARIANT_BOOL>(AutomationBoolean(boolean), value);
}
inline HRESULT PutBoolean(bool& boolean, VARIANT_BOOL value) noexcept {
  boolean = value != VARIANT_FALSE;
  return S_OK;
}

}  // namespace tarnwick
