#include "FilePane.h"

#include "platform/windows/CommonControls.h"
#include "platform/windows/SystemDpi.h"

namespace tarnwick::demo {

bool FilePane::CreateControl(HWND window, HFONT font, REFCLSID classId, const EventHandler& onEvent) {
  container_ = ComPtr<ControlContainer>::Adopt(new ControlContainer(window));
  container_->onEvent = onEvent;
  container_->onActivate = [this](bool ui) {
    if (ui && onUse) onUse();
    return S_OK;
  };
  // Files and pictures stand on the paper of a list, as users know it.
  container_->ambient.backColor = 0x80000000 | COLOR_WINDOW;
  container_->ambient.foreColor = 0x80000000 | COLOR_WINDOWTEXT;
  // The form's font is the one of its controls.
  LOGFONTW form = {};
  GetObjectW(font, sizeof form, &form);
  FONTDESC described = {};
  described.cbSizeofstruct = sizeof described;
  described.lpstrName = form.lfFaceName;
  described.cySize.int64 = MulDiv(-form.lfHeight, 72 * 10'000, SystemDpi());  // in ten thousandths of a point
  described.sWeight = static_cast<SHORT>(form.lfWeight);
  described.sCharset = form.lfCharSet;
  OleCreateFontIndirect(&described, IID_IFontDisp, container_->ambient.font.ReceiveVoid());
  return SUCCEEDED(container_->Create(classId, ControlContainer::WayIn::kSteps, nullptr));
}

HWND FilePane::Window() const {
  ComPtr<IOleWindow> window;
  HWND control = nullptr;
  if (Control() && SUCCEEDED(Control()->QueryInterface(IID_IOleWindow, window.ReceiveVoid())))
    window->GetWindow(&control);
  return control;
}

void FilePane::Deactivate() {
  ComPtr<IOleInPlaceObject> control;
  if (Control() && SUCCEEDED(Control()->QueryInterface(IID_IOleInPlaceObject, control.ReceiveVoid())))
    control->UIDeactivate();
}

double FilePane::SizeIn(IDispatch& files) {
  VARIANT position = VariantFromNumber(1);
  DISPPARAMS arguments = {&position, nullptr, 1, 0};
  Variant item;
  // Collections are reached late bound; their Item is the member that needs no name.
  files.Invoke(DISPID_VALUE, IID_NULL, LOCALE_USER_DEFAULT, DISPATCH_METHOD | DISPATCH_PROPERTYGET,
               &arguments, &item.Get(), nullptr, nullptr);
  ComPtr<_CUpload> file;
  double size = 0;
  if (V_VT(&item.Get()) == VT_DISPATCH &&
      SUCCEEDED(V_DISPATCH(&item.Get())->QueryInterface(__uuidof(_CUpload), file.ReceiveVoid())))
    file->get_FileSize(&size);
  return size;
}

bool ListPane::Init(const std::wstring& filter) {
  VARIANT_BOOL on = VARIANT_TRUE;
  VARIANT ignored = {};
  control_->SetMultiSelectProperty(&on, &ignored);
  const bool done = FilePaneOf::Init(filter);
  SpreadColumns();
  return done;
}

void ListPane::Delete() {
  FilePaneOf::Delete();
  // The control has listed the account again.
  SpreadColumns();
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

void ListPane::SpreadColumns() {
  const HWND list = ListWindow();
  RECT area = {};
  GetClientRect(list, &area);
  // Leaves room for a scroll bar.
  for (WPARAM column = 0; column < 3; ++column)
    SendMessageW(list, LVM_SETCOLUMNWIDTH, column, area.right * 31 / 100);
}

int ListPane::SelectedCount() const {
  Variant names;
  LONG last = -1;
  control_->GetFileNames(&names.Get());
  if (V_VT(&names.Get()) & VT_ARRAY) SafeArrayGetUBound(V_ARRAY(&names.Get()), 1, &last);
  return static_cast<int>(last + 1);
}

void ListPane::Focus() {
  VARIANT ignored = {};
  control_->ListViewSetFocus(&ignored);
}

void ThumbnailPane::Focus() {
  VARIANT ignored = {};
  control_->PictureSetFocus(&ignored);
}

bool ThumbnailPane::IsPicture(HWND window) const {
  wchar_t kind[16] = L"";
  GetClassNameW(window, kind, 16);
  return IsChild(Window(), window) && _wcsicmp(kind, WC_STATICW) == 0;
}

void ThumbnailPane::StartRename() {
  // The control has no member for it: the key does it.
  Focus();
  PostMessageW(GetFocus(), WM_KEYDOWN, VK_F2, 1);
}

}  // namespace tarnwick::demo
