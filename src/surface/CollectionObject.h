// The collection that the library makes when a host hands in none: Add(Item, [Key], [Before], [After]),
// Count, Item(Index) (the default member), Remove(Index), and an enumerator for "For Each". Index is a
// position from 1 on or a key. Keys are compared exactly.
//
// It is reached late-bound only and stands in no type library, so that it takes the place of any collection
// of the host's.
#pragma once

#include "base/KeyedList.h"
#include "surface/Automation.h"
#include "surface/ComObject.h"

namespace tarnwick {

class CollectionObject final : public ComObject<IDispatch> {
 public:
  // Adds an item without a key.
  void Append(Variant item) { items_.Add(std::move(item)); }

  STDMETHODIMP GetTypeInfoCount(UINT* count) override;
  STDMETHODIMP GetTypeInfo(UINT index, LCID locale, ITypeInfo** info) override;
  STDMETHODIMP GetIDsOfNames(REFIID reserved, LPOLESTR* names, UINT count, LCID locale, DISPID* ids) override;
  STDMETHODIMP Invoke(DISPID member, REFIID reserved, LCID locale, WORD flags, DISPPARAMS* arguments,
                      VARIANT* result, EXCEPINFO* exception, UINT* argumentError) override;

 private:
  // Members by identifier; they throw run-time errors, which Invoke hands to the host.
  HRESULT Call(DISPID member, WORD flags, const DISPPARAMS& arguments, VARIANT* result);
  void Add(const DISPPARAMS& arguments);
  const Variant& ItemAt(const VARIANT& index) const;
  // Position that an index argument means. Throws 5 for an unknown key, 9 for a position out of range.
  std::size_t PositionOf(const VARIANT& index) const;

  KeyedList<Variant> items_;
};

}  // namespace tarnwick
