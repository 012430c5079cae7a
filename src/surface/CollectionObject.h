// The collection that the library makes when a host hands in none: Add(Item, [Key], [Before], [After]),
// Count, Item(Index) (the default member), Remove(Index), and an enumerator for "For Each". Index is a
// position from 1 on or a key. Keys are compared exactly.
//
// It is reached late-bound only and stands in no type library, so that it takes the place of any collection
// of the host's.
#pragma once

#include "base/KeyedList.h"
#include "surface/LateBoundObject.h"

namespace tarnwick {

class CollectionObject final : public LateBoundObject<IDispatch> {
 public:
  // Adds an item without a key.
  void Append(Variant item) { items_.Add(std::move(item)); }

 private:
  // LateBoundObject
  std::span<const LateBoundMember> Members() const override;
  HRESULT Call(DISPID member, const LateBoundArguments& arguments, Variant& result) override;
  const OLECHAR* DescriptionOf(std::int32_t number) const override;

  void Add(const LateBoundArguments& arguments);
  const Variant& ItemAt(const VARIANT& index) const;
  // Position that an index argument means, whose object may run the host's code. Throws 5 for an unknown key,
  // 9 for a position out of range.
  std::size_t PositionOf(const VARIANT& index) const;

  KeyedList<Variant> items_;
};

}  // namespace tarnwick
