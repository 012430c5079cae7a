#include "surface/CollectionObject.h"

#include <algorithm>
#include <array>
#include <vector>

#include "base/RuntimeError.h"
#include "surface/ComEnumerator.h"
#include "surface/Guard.h"

namespace tarnwick {
namespace {

constexpr DISPID kAdd = 1;
constexpr DISPID kCount = 2;
constexpr DISPID kItem = DISPID_VALUE;
constexpr DISPID kRemove = 3;

struct Member {
  const OLECHAR* name;
  DISPID id;
};
constexpr std::array kMembers = {Member{L"Add", kAdd}, Member{L"Count", kCount}, Member{L"Item", kItem},
                                 Member{L"Remove", kRemove}, Member{L"_NewEnum", DISPID_NEWENUM}};
// Parameters of Add, by position.
constexpr std::array<const OLECHAR*, 4> kAddParameters = {L"Item", L"Key", L"Before", L"After"};

// Names of automation members are the same in any letter case.
bool SameName(const OLECHAR* left, const OLECHAR* right) {
  return lstrcmpiW(left, right) == 0;
}

const OLECHAR* DescriptionOf(std::int32_t number) {
  switch (number) {
    case error::kInvalidCall:
      return L"There is no item of this key";
    case error::kSubscriptOutOfRange:
      return L"There is no item at this position";
    case error::kDuplicateKey:
      return L"This key is in use already";
    default:
      return L"The argument is of the wrong type";
  }
}

// The argument for parameter `index`; null when it was omitted.
const VARIANT* ArgumentAt(const DISPPARAMS& arguments, UINT index) {
  const VARIANT* found = nullptr;
  for (UINT i = 0; i < arguments.cNamedArgs; ++i)
    if (arguments.rgdispidNamedArgs[i] == static_cast<DISPID>(index)) found = &arguments.rgvarg[i];
  if (!found && index < arguments.cArgs - arguments.cNamedArgs)
    found = &arguments.rgvarg[arguments.cArgs - 1 - index];
  return found && V_VT(found) == VT_ERROR && V_ERROR(found) == DISP_E_PARAMNOTFOUND ? nullptr : found;
}

}  // namespace

STDMETHODIMP CollectionObject::GetTypeInfoCount(UINT* count) {
  if (!count) return E_POINTER;
  *count = 0;
  return S_OK;
}

STDMETHODIMP CollectionObject::GetTypeInfo(UINT, LCID, ITypeInfo** info) {
  if (info) *info = nullptr;
  return DISP_E_BADINDEX;
}

STDMETHODIMP CollectionObject::GetIDsOfNames(REFIID reserved, LPOLESTR* names, UINT count, LCID,
                                             DISPID* ids) {
  if (reserved != IID_NULL) return DISP_E_UNKNOWNINTERFACE;
  if (!names || !ids || count == 0) return E_INVALIDARG;
  std::fill_n(ids, count, DISPID_UNKNOWN);
  const auto* member = std::find_if(kMembers.begin(), kMembers.end(),
                                    [&](const Member& known) { return SameName(known.name, names[0]); });
  if (member == kMembers.end()) return DISP_E_UNKNOWNNAME;
  ids[0] = member->id;
  HRESULT result = S_OK;
  for (UINT i = 1; i < count; ++i) {
    const auto* parameter = std::find_if(kAddParameters.begin(), kAddParameters.end(),
                                         [&](const OLECHAR* known) { return SameName(known, names[i]); });
    if (member->id == kAdd && parameter != kAddParameters.end())
      ids[i] = static_cast<DISPID>(parameter - kAddParameters.begin());
    else if (SameName(names[i], L"Index") && (member->id == kItem || member->id == kRemove))
      ids[i] = 0;
    else
      result = DISP_E_UNKNOWNNAME;
  }
  return result;
}

STDMETHODIMP CollectionObject::Invoke(DISPID member, REFIID reserved, LCID, WORD flags, DISPPARAMS* arguments,
                                      VARIANT* result, EXCEPINFO* exception, UINT*) {
  if (reserved != IID_NULL) return DISP_E_UNKNOWNINTERFACE;
  if (!arguments) return E_INVALIDARG;
  if (result) VariantInit(result);
  return Guarded([&] {
    try {
      return Call(member, flags, *arguments, result);
    } catch (const RuntimeError& failure) {
      if (!exception) throw;
      *exception = {};
      exception->scode = ResultFromErrorNumber(failure.Number());
      exception->bstrSource = SysAllocString(L"Tarnwick");
      exception->bstrDescription = SysAllocString(DescriptionOf(failure.Number()));
      return DISP_E_EXCEPTION;
    }
  });
}

HRESULT CollectionObject::Call(DISPID member, WORD flags, const DISPPARAMS& arguments, VARIANT* result) {
  // Script hosts ask for a value as a method or as a property.
  if (!(flags & (DISPATCH_METHOD | DISPATCH_PROPERTYGET))) return DISP_E_MEMBERNOTFOUND;
  Variant value;
  const VARIANT* first = arguments.cArgs > 0 ? ArgumentAt(arguments, 0) : nullptr;
  const auto takes = [&](UINT least, UINT most) {
    return arguments.cArgs >= least && arguments.cArgs <= most;
  };
  switch (member) {
    case kAdd:
      if (!takes(1, kAddParameters.size())) return DISP_E_BADPARAMCOUNT;
      Add(arguments);
      break;
    case kCount:
      if (!takes(0, 0)) return DISP_E_BADPARAMCOUNT;
      value.Get() = VariantFromNumber(static_cast<std::int32_t>(items_.Count()));
      break;
    case kItem:
      if (!takes(1, 1) || !first) return DISP_E_BADPARAMCOUNT;
      value = Variant(ItemAt(*first).Get());
      break;
    case kRemove: {
      if (!takes(1, 1) || !first) return DISP_E_BADPARAMCOUNT;
      // Taken out first: an item's last release may run code of the host's that uses this collection.
      const Variant removed = items_.Take(PositionOf(*first));
      break;
    }
    case DISPID_NEWENUM: {
      // "For Each" walks the items as they are now.
      std::vector<VARIANT> items;
      items.reserve(items_.Count());
      for (std::size_t i = 1; i <= items_.Count(); ++i) items.push_back(items_.At(i).Get());
      IUnknown* enumerator = new ComEnumerator<IEnumVARIANT, VARIANT>(std::move(items));
      V_VT(&value.Get()) = VT_UNKNOWN;
      V_UNKNOWN(&value.Get()) = enumerator;
      break;
    }
    default:
      return DISP_E_MEMBERNOTFOUND;
  }
  if (result) *result = value.Detach();
  return S_OK;
}

void CollectionObject::Add(const DISPPARAMS& arguments) {
  const VARIANT* item = ArgumentAt(arguments, 0);
  const VARIANT* key = ArgumentAt(arguments, 1);
  const VARIANT* before = ArgumentAt(arguments, 2);
  const VARIANT* after = ArgumentAt(arguments, 3);
  if (!item || (before && after)) throw RuntimeError(error::kInvalidCall);
  const std::size_t position = before  ? PositionOf(*before)
                               : after ? PositionOf(*after) + 1
                                       : items_.Count() + 1;
  items_.Insert(position, Variant(*item), key ? TextFromVariant(*key) : Text());
}

// By its key without a walk.
const Variant& CollectionObject::ItemAt(const VARIANT& index) const {
  const Variant plain(index);
  if (V_VT(&plain.Get()) != VT_BSTR) return items_.At(PositionOf(plain.Get()));
  const Variant* found = items_.Find(ViewOf(V_BSTR(&plain.Get())));
  if (!found) throw RuntimeError(error::kInvalidCall);
  return *found;
}

std::size_t CollectionObject::PositionOf(const VARIANT& index) const {
  const Variant plain(index);
  if (V_VT(&plain.Get()) == VT_BSTR) {
    const std::size_t position = items_.PositionOf(ViewOf(V_BSTR(&plain.Get())));
    if (position == 0) throw RuntimeError(error::kInvalidCall);
    return position;
  }
  const std::int32_t position = NumberFromVariant(plain.Get());
  if (position < 1 || static_cast<std::size_t>(position) > items_.Count())
    throw RuntimeError(error::kSubscriptOutOfRange);
  return static_cast<std::size_t>(position);
}

}  // namespace tarnwick
