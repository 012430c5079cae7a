#include "surface/AmbientValues.h"

#include <olectl.h>

#include "surface/Automation.h"

namespace tarnwick {
namespace {

// One of the container's values; false when it does not say.
bool Ask(const ComPtr<IOleClientSite>& asked, DISPID property, Variant& value) {
  // Held: the container may set another site inside.
  const ComPtr<IOleClientSite> site(asked.Get());
  ComPtr<IDispatch> ambient;
  if (!site || FAILED(site->QueryInterface(IID_IDispatch, ambient.ReceiveVoid())) || !ambient) return false;
  DISPPARAMS none = {};
  return SUCCEEDED(ambient->Invoke(property, IID_NULL, LOCALE_USER_DEFAULT, DISPATCH_PROPERTYGET, &none,
                                   &value.Get(), nullptr, nullptr));
}

}  // namespace

AmbientValues AskAmbientValues(const ComPtr<IOleClientSite>& site) {
  AmbientValues values;
  const auto color = [&](DISPID property, COLORREF& result) {
    Variant value;
    return Ask(site, property, value) && (V_VT(&value.Get()) == VT_I4 || V_VT(&value.Get()) == VT_UI4) &&
           SUCCEEDED(OleTranslateColor(static_cast<OLE_COLOR>(V_I4(&value.Get())), nullptr, &result));
  };
  values.hasBackColor = color(DISPID_AMBIENT_BACKCOLOR, values.backColor);
  values.hasForeColor = color(DISPID_AMBIENT_FORECOLOR, values.foreColor);
  Variant font;
  if (Ask(site, DISPID_AMBIENT_FONT, font) &&
      (V_VT(&font.Get()) == VT_DISPATCH || V_VT(&font.Get()) == VT_UNKNOWN) && V_UNKNOWN(&font.Get()))
    V_UNKNOWN(&font.Get())->QueryInterface(IID_IFont, values.font.ReceiveVoid());
  Variant mode;
  if (Ask(site, DISPID_AMBIENT_USERMODE, mode) && V_VT(&mode.Get()) == VT_BOOL)
    values.userMode = V_BOOL(&mode.Get()) != VARIANT_FALSE;
  return values;
}

}  // namespace tarnwick
