// ctrlListImage as hosts see it: what the list adds to the members of both controls.
#pragma once

#include <memory>

#include "controls/listimage/ctrlListImage.h"
#include "controls/windows/WindowsListView.h"
#include "surface/FileControlObject.h"

namespace tarnwick {

class ctrlListImageObject final : public FileControlObject<_ctrlListImage>, private ListViewUser {
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
  ControlWindow& View() override { return view_; }

  // OleControlHooks
  void Draw(HDC dc, const RECT& bounds) override { view_.Draw(dc, bounds); }
  void GiveFocus() override { view_.Focus(); }
  bool MoveFocus(bool) override { return false; }

  // ListViewUser
  Text ItemText(std::size_t item, std::size_t column) const override;
  bool IsGif(std::size_t item) const override;
  std::optional<std::size_t> FindItem(TextView prefix, std::size_t start) const override;
  void KeyPressed(int key) override;
  void EnterPressed() override;
  void ButtonPressed() override;
  void ButtonDone() override;
  void Clicked() override;
  bool LabelEditBegins(std::size_t item) override;
  bool LabelEditEnds(std::size_t item, TextView text) override;
  void DragBegins() override { RunDragOut(); }
  void GotFocus() override;
  void LostFocus() override;

  WindowsListView view_;
  const std::unique_ptr<ctrlListImage> rules_;
};

}  // namespace tarnwick
