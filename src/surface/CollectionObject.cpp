#include "surface/CollectionObject.h"

#include <array>
#include <vector>

#include "base/RuntimeError.h"
#include "surface/ComEnumerator.h"

namespace tarnwick {
namespace {

constexpr DISPID kAdd = 1;
constexpr DISPID kCount = 2;
constexpr DISPID kItem = DISPID_VALUE;
constexpr DISPID kRemove = 3;

// Parameters, by position.
constexpr std::array<const OLECHAR*, 4> kAddParameters = {L"Item", L"Key", L"Before", L"After"};
constexpr std::array<const OLECHAR*, 1> kIndexParameter = {L"Index"};
constexpr std::array kMembers = {
    LateBoundMember{L"Add", kAdd, kAddParameters}, LateBoundMember{L"Count", kCount},
    LateBoundMember{L"Item", kItem, kIndexParameter}, LateBoundMember{L"Remove", kRemove, kIndexParameter},
    LateBoundMember{L"_NewEnum", DISPID_NEWENUM}};

}  // namespace

std::span<const LateBoundMember> CollectionObject::Members() const {
  return kMembers;
}

const OLECHAR* CollectionObject::DescriptionOf(std::int32_t number) const {
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

HRESULT CollectionObject::Call(DISPID member, const LateBoundArguments& arguments, Variant& result) {
  const VARIANT* first = arguments.Count() > 0 ? arguments.At(0) : nullptr;
  const auto takes = [&](UINT least, UINT most) {
    return arguments.Count() >= least && arguments.Count() <= most;
  };
  switch (member) {
    case kAdd:
      if (!takes(1, kAddParameters.size())) return DISP_E_BADPARAMCOUNT;
      Add(arguments);
      break;
    case kCount:
      if (!takes(0, 0)) return DISP_E_BADPARAMCOUNT;
      result.Get() = VariantFromNumber(static_cast<std::int32_t>(items_.Count()));
      break;
    case kItem:
      if (!takes(1, 1) || !first) return DISP_E_BADPARAMCOUNT;
      result = Variant(ItemAt(*first).Get());
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
      V_VT(&result.Get()) = VT_UNKNOWN;
      V_UNKNOWN(&result.Get()) = enumerator;
      break;
    }
    default:
      return DISP_E_MEMBERNOTFOUND;
  }
  return S_OK;
}

void CollectionObject::Add(const LateBoundArguments& arguments) {
  const VARIANT* item = arguments.At(0);
  const VARIANT* key = arguments.At(1);
  const VARIANT* before = arguments.At(2);
  const VARIANT* after = arguments.At(3);
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
