// Values at the border to automation: BSTR and VARIANT on the outside, Text on the inside.
#pragma once

#include "platform/windows/WindowsHeaders.h"

#include <oleauto.h>

#include <cstdint>
#include <utility>

#include "base/Text.h"

namespace tarnwick {

static_assert(sizeof(OLECHAR) == sizeof(char16_t));

// The locale of all conversions is fixed, so that a number becomes the same text on every machine.
inline constexpr LCID kConversionLocale = 0x409;

// An owned VARIANT; empty at first.
class Variant {
 public:
  Variant() noexcept { VariantInit(&value_); }
  // Copies what `source` says, through a reference too. Throws std::bad_alloc.
  explicit Variant(const VARIANT& source);
  // A reference to an automation object; empty when it is none.
  explicit Variant(IUnknown* object) noexcept;
  ~Variant() { VariantClear(&value_); }
  Variant(Variant&& other) noexcept : value_(other.value_) { VariantInit(&other.value_); }
  Variant& operator=(Variant&& other) noexcept {
    std::swap(value_, other.value_);
    return *this;
  }
  Variant(const Variant&) = delete;
  Variant& operator=(const Variant&) = delete;

  const VARIANT& Get() const { return value_; }
  VARIANT& Get() { return value_; }

  // Gives the value to the caller; the object is empty afterwards.
  VARIANT Detach() noexcept {
    const VARIANT value = value_;
    VariantInit(&value_);
    return value;
  }

 private:
  VARIANT value_;
};

// A new BSTR that the caller owns. Throws std::bad_alloc.
BSTR NewBstr(TextView text);

// The characters of a BSTR, which may be null; valid as long as it.
TextView ViewOf(BSTR text);

// The same of a by-reference argument, which may be null.
inline TextView ViewOf(BSTR* text) {
  return text ? ViewOf(*text) : TextView();
}
// Hands a text back through a by-reference argument, which may be null, unless it has not changed. Throws
// std::bad_alloc.
void AssignChanged(BSTR* target, TextView text);

// The text, number or Boolean that `value` means, by the automation's own conversion; an omitted argument is
// an empty text. Runs the host's code when the value is an object of the host's. Throws run-time error 13
// when there is none.
Text TextFromVariant(const VARIANT& value);
std::int32_t NumberFromVariant(const VARIANT& value);
bool BooleanFromVariant(const VARIANT& value);

inline VARIANT_BOOL AutomationBoolean(bool value) {
  return value ? VARIANT_TRUE : VARIANT_FALSE;
}

// The value as a VARIANT that the caller owns.
VARIANT VariantFromNumber(std::int32_t number);
VARIANT VariantFromText(TextView text);

// How automation carries a run-time error's number: hosts see it as the error's number.
constexpr HRESULT ResultFromErrorNumber(std::int32_t number) {
  return number >= 0 && number <= 0xFFFF
             ? static_cast<HRESULT>(MAKE_HRESULT(SEVERITY_ERROR, FACILITY_CONTROL, number))
             : number;
}

}  // namespace tarnwick
