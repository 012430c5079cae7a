#include "FilePane.h"

#include "platform/windows/CommonControls.h"

namespace tarnwick::demo {

bool FilePane::CreateControl(HWND window, REFCLSID classId, const EventHandler& onEvent) {
  container_ = ComPtr<ControlContainer>::Adopt(new ControlContainer(window));
  container_->onEvent = onEvent;
  FONTDESC font = {};
  font.cbSizeofstruct = sizeof font;
  std::wstring name = L"Tahoma";
  font.lpstrName = name.data();
  font.cySize.int64 = 90000;  // 9 points
  font.sWeight = FW_NORMAL;
  OleCreateFontIndirect(&font, IID_IFontDisp, container_->ambient.font.ReceiveVoid());
  return SUCCEEDED(container_->Create(classId, ControlContainer::WayIn::kSteps, nullptr));
}

HWND FilePane::Window() const {
  ComPtr<IOleWindow> window;
  HWND control = nullptr;
  if (SUCCEEDED(Control()->QueryInterface(IID_IOleWindow, window.ReceiveVoid()))) window->GetWindow(&control);
  return control;
}

bool ListPane::Init(const std::wstring& filter) {
  VARIANT_BOOL on = VARIANT_TRUE;
  VARIANT ignored = {};
  control_->SetMultiSelectProperty(&on, &ignored);
  return FilePaneOf::Init(filter);
}

HWND ListPane::ListWindow() const {
  return FindWindowExW(Window(), nullptr, WC_LISTVIEWW, nullptr);
}

int ListPane::Count() const {
  return static_cast<int>(SendMessageW(ListWindow(), LVM_GETITEMCOUNT, 0, 0));
}

void ListPane::StartRename() {
  const HWND list = ListWindow();
  SetFocus(list);
  const auto selected = SendMessageW(list, LVM_GETNEXTITEM, static_cast<WPARAM>(-1), LVNI_SELECTED);
  SendMessageW(list, LVM_EDITLABELW, static_cast<WPARAM>(selected), 0);
}

void ThumbnailPane::StartRename() {
  // The control has no member for it: the key does it.
  VARIANT ignored = {};
  control_->PictureSetFocus(&ignored);
  PostMessageW(GetFocus(), WM_KEYDOWN, VK_F2, 1);
}

}  // namespace tarnwick::demo
