#include "controls/windows/ControlWindow.h"

#include <atomic>
#include <mutex>

#include "controls/windows/Drawing.h"
#include "platform/windows/CommonControls.h"
#include "platform/windows/SystemDpi.h"

namespace tarnwick {
namespace {

constexpr UINT_PTR kSubclass = 1;

HCURSOR PointerOf(bool hourglass) {
  return LoadCursorW(nullptr, reinterpret_cast<LPCWSTR>(hourglass ? IDC_WAIT : IDC_ARROW));
}

std::atomic<int> windows{0};

// Held from the registration of a window class to the making of a window of it, so that no other thread takes
// the class away in between. Recursive: programs may hook the making of windows.
std::recursive_mutex classes;

// A hidden window that holds the windows of controls that are in no container. Each thread has its own:
// windows go with the thread that made them, and take along what they hold.
thread_local HWND parking = nullptr;

// Messages of controls that the thread handles now, one inside the other.
thread_local int handling = 0;

// Ends a parked window, of the class whose name is the other parameter.
constexpr UINT kEndParked = WM_APP;

// Classes of windows outlive the library that registered them, with an address in it.
void LeaveNothing(HINSTANCE module, const wchar_t* className) {
  if (parking && !GetWindow(parking, GW_CHILD)) DestroyWindow(parking);
  const std::lock_guard guard(classes);
  UnregisterClassW(className, module);  // fails while there are windows of it
}

LRESULT CALLBACK ParkingProc(HWND window, UINT message, WPARAM wParam, LPARAM lParam, UINT_PTR id,
                             DWORD_PTR module) {
  if (message == kEndParked) {
    DestroyWindow(reinterpret_cast<HWND>(wParam));
    LeaveNothing(reinterpret_cast<HINSTANCE>(module), reinterpret_cast<const wchar_t*>(lParam));
    return 0;
  }
  if (message == WM_NCDESTROY) {
    RemoveWindowSubclass(window, ParkingProc, id);
    parking = nullptr;
  }
  return DefSubclassProc(window, message, wParam, lParam);
}

HWND ParkingWindow(HINSTANCE module) {
  if (!parking) {
    parking = CreateWindowExW(WS_EX_TOOLWINDOW, L"STATIC", L"", WS_POPUP, 0, 0, 0, 0, nullptr, nullptr,
                              module, nullptr);
    SetWindowSubclass(parking, ParkingProc, kSubclass, reinterpret_cast<DWORD_PTR>(module));
  }
  return parking;
}

// Before Windows 10 all screens have the system's.
int DpiOf(HWND window) {
  static const auto get = reinterpret_cast<UINT(WINAPI*)(HWND)>(
      reinterpret_cast<void*>(GetProcAddress(GetModuleHandleW(L"user32.dll"), "GetDpiForWindow")));
  const UINT dpi = get ? get(window) : 0;
  return dpi != 0 ? static_cast<int>(dpi) : SystemDpi();
}

}  // namespace

ControlWindow::ControlWindow(HINSTANCE module, const wchar_t* className, ControlWindowUser& control)
    : control_(control), module_(module), className_(className), dpi_(SystemDpi()) {}

ControlWindow::~ControlWindow() {
  if (!window_) {
    if (registered_) LeaveNothing(module_, className_);
    return;
  }
  // No message reaches the object from here on.
  SetWindowLongPtrW(window_, GWLP_USERDATA, 0);
  if (handling == 0) {
    DestroyWindow(window_);
    LeaveNothing(module_, className_);
    return;
  }
  // The host let go of the control inside one of its messages. The system's own windows may not be done with
  // that message yet, so they go with the next one.
  Park();
  PostMessageW(parking, kEndParked, reinterpret_cast<WPARAM>(window_), reinterpret_cast<LPARAM>(className_));
}

bool ControlWindow::AnyLeft() {
  return windows > 0;
}

HWND ControlWindow::Window() {
  // Half of a window would stay empty.
  if (!window_ && !ResultAsItStood(false, [&](bool& made) { made = MakeWindow(); }) && window_)
    DestroyWindow(window_);
  return window_;
}

bool ControlWindow::MakeWindow() {
  WNDCLASSEXW windowClass = {};
  windowClass.cbSize = sizeof windowClass;
  windowClass.lpfnWndProc = WindowProc;
  windowClass.hInstance = module_;
  windowClass.hbrBackground = reinterpret_cast<HBRUSH>(COLOR_WINDOW + 1);
  windowClass.hCursor = PointerOf(false);
  windowClass.lpszClassName = className_;
  {
    const std::lock_guard guard(classes);
    RegisterClassExW(&windowClass);  // fails when it is registered already
    registered_ = true;
    window_ = CreateWindowExW(WS_EX_CONTROLPARENT, className_, L"", WS_CHILD | WS_CLIPCHILDREN, 0, 0, 0, 0,
                              ParkingWindow(module_), nullptr, module_, this);
  }
  if (!window_ || !MakeChildren()) return false;
  made_ = true;
  ApplyLook();
  return true;
}

HWND ControlWindow::MakeChild(HWND parent, const wchar_t* className, const wchar_t* name, DWORD style,
                              const RECT& place) {
  const HWND child =
      CreateWindowExW(0, className, name, WS_CHILD | style, place.left, place.top, place.right - place.left,
                      place.bottom - place.top, parent, nullptr, module_, nullptr);
  if (child) Watch(child);
  return child;
}

void ControlWindow::Watch(HWND window) {
  SetWindowSubclass(window, ChildProc, kSubclass, reinterpret_cast<DWORD_PTR>(window_));
}

std::optional<SIZE> ControlWindow::SizeOnOtherScreen() const {
  RECT client = {};
  if (dpi_ == SystemDpi() || !GetClientRect(window_, &client)) return std::nullopt;
  return SIZE{client.right, client.bottom};
}

HFONT ControlWindow::Font() const {
  if (font_) return font_;
  return ownFont_ ? ownFont_.Get() : static_cast<HFONT>(GetStockObject(DEFAULT_GUI_FONT));
}

void ControlWindow::FollowDpi() {
  // Nobody sees it, and it may come back to where it was.
  if (GetAncestor(window_, GA_PARENT) == parking) return;
  const int now = DpiOf(window_);
  if (now == dpi_) return;
  const int before = std::exchange(dpi_, now);
  const int system = SystemDpi();
  // The old one is in use until the look is applied.
  const FontOwner old = std::exchange(ownFont_, {});
  if (now != system) {
    LOGFONTW font = {};
    GetObjectW(GetStockObject(DEFAULT_GUI_FONT), sizeof font, &font);
    font.lfHeight = MulDiv(font.lfHeight, now, system);
    ownFont_ = FontOwner(CreateFontIndirectW(&font));
  }
  DpiChanged(before);
  ApplyLook();
  InvalidateRect(window_, nullptr, TRUE);
}

void ControlWindow::Park() {
  if (!window_) return;
  ShowWindow(window_, SW_HIDE);
  SetParent(window_, ParkingWindow(module_));
}

void ControlWindow::SetLook(HFONT font, std::optional<COLORREF> text, std::optional<COLORREF> background) {
  font_ = font;
  textColor_ = text;
  backColor_ = background;
  if (!made_) return;
  ApplyLook();
  InvalidateRect(window_, nullptr, TRUE);
}

void ControlWindow::ShowHourglass(bool hourglass) {
  hourglass_ = hourglass;
  POINT at = {};
  if (window_ && GetCursorPos(&at) && ScreenToClient(window_, &at)) {
    RECT client = {};
    GetClientRect(window_, &client);
    if (PtInRect(&client, at)) SetCursor(PointerOf(hourglass));
  }
}

ControlWindow* ControlWindow::Of(HWND outer) {
  return reinterpret_cast<ControlWindow*>(GetWindowLongPtrW(outer, GWLP_USERDATA));
}

// Runs the handler of a message, whose exceptions end here, and keeps the control alive meanwhile. The object
// may be gone afterwards.
template <typename Body>
LRESULT ControlWindow::Handle(Body&& body) {
  ++handling;
  ComPtr<ControlWindowUser> alive(&control_);
  const LRESULT result = ResultAsItStood(LRESULT{0}, [&](LRESULT& answer) { answer = body(); });
  // Inside the message still, for what ends here.
  alive = {};
  --handling;
  return result;
}

void ControlWindow::TellFocusLeft(HWND outer, UINT message, WPARAM wParam) {
  const auto to = reinterpret_cast<HWND>(wParam);
  if (message == WM_KILLFOCUS && window_ == outer && to != outer && !IsChild(outer, to)) control_.FocusLeft();
}

// Containers ask the control about Tab, or a dialog's loop takes it. In a form that does neither the key
// arrives here, and nobody could leave the control by the keyboard: after the last stop it is the form's.
std::optional<LRESULT> ControlWindow::OnTab(HWND outer, UINT message, WPARAM wParam, LPARAM lParam) {
  if (message != WM_KEYDOWN || wParam != VK_TAB || GetKeyState(VK_CONTROL) < 0) return std::nullopt;
  const HWND container = GetAncestor(outer, GA_PARENT);
  if (!MoveFocus(GetKeyState(VK_SHIFT) < 0)) SendMessageW(container, message, wParam, lParam);
  return 0;
}

// What is seen beside the children, and behind the texts of labels.
LRESULT ControlWindow::OnLook(HWND window, UINT message, WPARAM wParam, LPARAM lParam) const {
  const auto dc = reinterpret_cast<HDC>(wParam);
  switch (message) {
    case WM_ERASEBKGND: {
      RECT client = {};
      GetClientRect(window, &client);
      Fill(dc, client, BackColor());
      return TRUE;
    }
    case WM_CTLCOLORSTATIC:
      SetTextColor(dc, TextColor());
      SetBkColor(dc, BackColor());
      SetDCBrushColor(dc, BackColor());
      return reinterpret_cast<LRESULT>(GetStockObject(DC_BRUSH));
    default:
      return DefWindowProcW(window, message, wParam, lParam);
  }
}

LRESULT CALLBACK ControlWindow::WindowProc(HWND window, UINT message, WPARAM wParam, LPARAM lParam) {
  if (message == WM_NCCREATE) {
    ++windows;
    const auto* create = reinterpret_cast<const CREATESTRUCTW*>(lParam);
    SetWindowLongPtrW(window, GWLP_USERDATA, reinterpret_cast<LONG_PTR>(create->lpCreateParams));
  }
  if (message == WM_NCDESTROY) --windows;
  ControlWindow* self = Of(window);
  if (self && message == WM_DESTROY) {
    self->control_.WindowEnds();
    SetWindowLongPtrW(window, GWLP_USERDATA, 0);
    self->window_ = nullptr;
    self->made_ = false;
    self->WindowGone();
  } else if (self && self->made_) {
    return self->Handle([&] {
      if (message == WM_SETCURSOR && self->hourglass_) {
        SetCursor(PointerOf(true));
        return LRESULT{TRUE};
      }
      // Programs that follow the screen are told so; others move the control to another window.
      if (message == WM_DPICHANGED_AFTERPARENT || message == WM_WINDOWPOSCHANGED) self->FollowDpi();
      const std::optional<LRESULT> answer = self->OnMessage(window, message, wParam, lParam);
      const LRESULT result = answer ? *answer : self->OnLook(window, message, wParam, lParam);
      self->TellFocusLeft(window, message, wParam);
      return result;
    });
  }
  return DefWindowProcW(window, message, wParam, lParam);
}

LRESULT CALLBACK ControlWindow::ChildProc(HWND window, UINT message, WPARAM wParam, LPARAM lParam,
                                          UINT_PTR id, DWORD_PTR data) {
  const auto outer = reinterpret_cast<HWND>(data);
  ControlWindow* self = Of(outer);
  if (message == WM_NCDESTROY) {
    RemoveWindowSubclass(window, ChildProc, id);
  } else if (self && self->made_) {
    // The child's own procedure runs inside too: it may wait for more messages, and must not lose its window
    // meanwhile.
    return self->Handle([&] {
      if (const auto taken = self->OnTab(outer, message, wParam, lParam)) return *taken;
      const std::optional<LRESULT> answer = self->OnMessage(window, message, wParam, lParam);
      const LRESULT result = answer ? *answer : DefSubclassProc(window, message, wParam, lParam);
      self->TellFocusLeft(outer, message, wParam);
      return result;
    });
  }
  return DefSubclassProc(window, message, wParam, lParam);
}

}  // namespace tarnwick
