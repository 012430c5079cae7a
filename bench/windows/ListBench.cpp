// Showing all records of a large account that were listed before, beside a bare owner-data list of as many
// items, both in a window on the display.
#include "Bench.h"

#include "ControlContainer.h"
#include "platform/windows/CommonControls.h"

#include <cstdio>

namespace tarnwick::bench {
namespace {

constexpr RECT kBounds = {0, 0, 600, 400};

void Paint(HWND window) {
  RedrawWindow(window, nullptr, nullptr, RDW_UPDATENOW | RDW_ALLCHILDREN);
}

LRESULT CALLBACK FrameProc(HWND window, UINT message, WPARAM wParam, LPARAM lParam) {
  const auto* const header = reinterpret_cast<const NMHDR*>(lParam);
  if (message == WM_NOTIFY && header->code == static_cast<UINT>(LVN_GETDISPINFOW)) {
    auto& info = *reinterpret_cast<NMLVDISPINFOW*>(lParam);
    if (info.item.mask & LVIF_TEXT)
      std::swprintf(info.item.pszText, static_cast<std::size_t>(info.item.cchTextMax), L"picture-%06d.jpg",
                    info.item.iItem);
    return 0;
  }
  return DefWindowProcW(window, message, wParam, lParam);
}

// Makes a bare list, fills and paints it, and takes it away.
void ShowBareList(HWND frame, int items) {
  const HWND view =
      CreateWindowExW(0, WC_LISTVIEWW, L"", WS_CHILD | WS_VISIBLE | LVS_REPORT | LVS_OWNERDATA, kBounds.left,
                      kBounds.top, kBounds.right, kBounds.bottom, frame, nullptr, nullptr, nullptr);
  wchar_t title[] = L"Column";
  for (int i = 0; i < 3; ++i) {
    LVCOLUMNW column = {};
    column.mask = LVCF_TEXT | LVCF_WIDTH;
    column.cx = 96;
    column.pszText = title;
    ListView_InsertColumn(view, i, &column);
  }
  ListView_SetItemCountEx(view, items, 0);
  Paint(view);
  DestroyWindow(view);
}

BOOL CALLBACK CountItems(HWND child, LPARAM count) {
  wchar_t name[32] = {};
  GetClassNameW(child, name, 32);
  if (wcscmp(name, WC_LISTVIEWW) == 0) *reinterpret_cast<int*>(count) = ListView_GetItemCount(child);
  return TRUE;
}

}  // namespace

void ListBench(const Account& account, int records) {
  const INITCOMMONCONTROLSEX classes = {sizeof classes, ICC_LISTVIEW_CLASSES};
  InitCommonControlsEx(&classes);
  WNDCLASSW frameClass = {};
  frameClass.lpfnWndProc = FrameProc;
  frameClass.lpszClassName = L"ListBenchFrame";
  RegisterClassW(&frameClass);
  const HWND frame = CreateWindowExW(0, frameClass.lpszClassName, L"", WS_POPUP | WS_VISIBLE, 0, 0,
                                     kBounds.right, kBounds.bottom, nullptr, nullptr, nullptr, nullptr);
  auto container = ComPtr<demo::ControlContainer>::Adopt(new demo::ControlContainer(frame));
  if (FAILED(container->Create(CLSID_ctrlListImage, demo::ControlContainer::WayIn::kSteps, nullptr)))
    Stop("the library is not registered");
  container->SetBounds(kBounds);
  container->Do(OLEIVERB_SHOW);
  ComPtr<_ctrlListImage> list;
  container->Control()->QueryInterface(__uuidof(_ctrlListImage), list.ReceiveVoid());
  LogOn(*list, account);
  int items = 0;
  EnumChildWindows(frame, CountItems, reinterpret_cast<LPARAM>(&items));
  if (items != records) Stop("the list does not show all records");

  const Bstr filter(L"*");
  const auto shown = Fastest(7, {[&] {
                                   list->ChangeFileFilter(filter);
                                   Paint(frame);
                                 },
                                 [&] { ShowBareList(frame, records); }});
  AtMost(3.0, "filter over 100,000 records", shown[0], "bare owner-data list", shown[1]);
  list = {};
  container->Close();
  DestroyWindow(frame);
}

}  // namespace tarnwick::bench
