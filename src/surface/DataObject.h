// What a drag carries, as OLE sees it (formats) and as hosts see it in the drag events (an automation object
// with GetData, SetData, GetFormat, Clear and Files).
#pragma once

#include "platform/windows/WindowsHeaders.h"

#include <ole2.h>

#include <functional>
#include <optional>
#include <utility>
#include <vector>

#include "base/Text.h"
#include "controls/ControlEvents.h"
#include "platform/windows/ComPtr.h"
#include "surface/LateBoundObject.h"

namespace tarnwick {

class DataObject final : public LateBoundObject<IDataObject, IDispatch>, public DragData {
 public:
  // The data of a drag that begins in a control of ours: a text, and a file when its path is not empty.
  DataObject(TextView text, TextView file);
  // The data of a drag that comes from elsewhere, read when the object is made; that runs the source's code.
  explicit DataObject(IDataObject& foreign);

  // Who supplies a text that a host promised (SetData without a value) once a target asks for it: the handler
  // is given the format as the host wrote it and calls SetData, or leaves the text empty. None at first.
  void SetPromiseHandler(std::function<void(std::int16_t format)> handler) {
    onPromised_ = std::move(handler);
  }

  const std::vector<Text>& Files() const { return files_; }
  IDispatch* Dispatch() { return this; }

  // IDataObject
  STDMETHODIMP GetData(FORMATETC* format, STGMEDIUM* medium) override;
  STDMETHODIMP GetDataHere(FORMATETC* format, STGMEDIUM* medium) override;
  STDMETHODIMP QueryGetData(FORMATETC* format) override;
  STDMETHODIMP GetCanonicalFormatEtc(FORMATETC* format, FORMATETC* canonical) override;
  STDMETHODIMP SetData(FORMATETC* format, STGMEDIUM* medium, BOOL release) override;
  STDMETHODIMP EnumFormatEtc(DWORD direction, IEnumFORMATETC** enumerator) override;
  STDMETHODIMP DAdvise(FORMATETC* format, DWORD flags, IAdviseSink* sink, DWORD* cookie) override;
  STDMETHODIMP DUnadvise(DWORD cookie) override;
  STDMETHODIMP EnumDAdvise(IEnumSTATDATA** enumerator) override;

 private:
  // LateBoundObject
  std::span<const LateBoundMember> Members() const override;
  HRESULT Call(DISPID member, const LateBoundArguments& arguments, Variant& result) override;
  const OLECHAR* DescriptionOf(std::int32_t number) const override;

  bool Has(CLIPFORMAT format) const;
  // The text. One that was promised is asked of the host first, whose code runs.
  const Text& FetchText();

  Text text_;
  bool hasText_ = false;
  // The format in which the host promised the text.
  std::optional<CLIPFORMAT> promised_;
  std::function<void(std::int16_t)> onPromised_;
  std::vector<Text> files_;
};

}  // namespace tarnwick
