// ctrlListImage as hosts see it: what the list adds to the members of both controls.
#pragma once

#include <memory>

#include "controls/listimage/ctrlListImage.h"
#include "controls/windows/WindowsListView.h"
#include "surface/FileControlObject.h"

namespace tarnwick {

class ctrlListImageObject final : public FileControlObject<_ctrlListImage> {
 public:
  explicit ctrlListImageObject(IUnknown* outer);

  STDMETHODIMP get_m_lDownloadedBytes(LONG* value) override;
  STDMETHODIMP put_m_lDownloadedBytes(LONG value) override;
  STDMETHODIMP ListViewSetFocus(VARIANT* result) override;
  STDMETHODIMP StartLabelExit(VARIANT* result) override;
  STDMETHODIMP GetFileNames(VARIANT* result) override;
  STDMETHODIMP Overlay(VARIANT* Key1, VARIANT* Key2, IPictureDisp** result) override;
  STDMETHODIMP SetMultiSelectProperty(VARIANT_BOOL* bVal, VARIANT* result) override;

 private:
  ~ctrlListImageObject() override { StopDrops(); }

  // FileControlObject
  FileControl& Rules() override { return *rules_; }
  ControlWindow& TheWindow() override { return view_; }

  // OleControlHooks
  void Draw(HDC dc, const RECT& bounds) override { view_.Draw(dc, bounds); }
  void GiveFocus() override { view_.Focus(); }
  bool MoveFocus(bool) override { return false; }

  WindowsListView view_;
  const std::unique_ptr<ctrlListImage> rules_;
};

}  // namespace tarnwick
