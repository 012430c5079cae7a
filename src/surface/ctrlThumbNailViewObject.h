// ctrlThumbNailView as hosts see it: what the thumbnails add to the members of both controls.
#pragma once

#include <memory>

#include "controls/thumbnailview/ctrlThumbNailView.h"
#include "controls/windows/WindowsScrollHook.h"
#include "controls/windows/WindowsThumbnailPage.h"
#include "surface/FileControlObject.h"

namespace tarnwick {

class ctrlThumbNailViewObject final : public FileControlObject<_ctrlThumbNailView> {
 public:
  explicit ctrlThumbNailViewObject(IUnknown* outer);

  STDMETHODIMP get_iImgNo(short* value) override;
  STDMETHODIMP put_iImgNo(short value) override;
  STDMETHODIMP EditFileLabel(VARIANT_BOOL* result) override;
  STDMETHODIMP SetLabelText(BSTR* szString, VARIANT* result) override;
  STDMETHODIMP ValidateFileName(BSTR* NewString, VARIANT* result) override;
  STDMETHODIMP PictureSetFocus(VARIANT* result) override;
  STDMETHODIMP Overlay(VARIANT* Key1, VARIANT* Key2, IPictureDisp** result) override;

 private:
  ~ctrlThumbNailViewObject() override { StopDrops(); }

  // FileControlObject
  FileControl& Rules() override { return *rules_; }
  ControlWindow& TheWindow() override { return page_; }
  void WindowMade(HWND window) override { scrollHook_.Install(window); }

  // OleControlHooks
  void Draw(HDC dc, const RECT& bounds) override { page_.Draw(dc, bounds); }
  void GiveFocus() override { page_.Focus(); }
  bool MoveFocus(bool backward) override { return page_.MoveFocus(backward); }

  WindowsThumbnailPage page_;
  WindowsScrollHook scrollHook_;
  const std::unique_ptr<ctrlThumbNailView> rules_;
};

}  // namespace tarnwick
