// What is left when objects are gone: nothing. The test build of the library counts what it holds, because
// the system's own counts are not to be had everywhere.
#include <functional>

#include "../library/TestLibrary.h"
#include "Form.h"

namespace tarnwick::test {
namespace {

// Windows of this process below `parent`, at any depth.
int WindowsBelow(HWND parent) {
  int count = 0;
  for (HWND child = nullptr; (child = FindWindowExW(parent, child, nullptr, nullptr)) != nullptr;) {
    DWORD process = 0;
    GetWindowThreadProcessId(child, &process);
    if (process == GetCurrentProcessId()) count += 1 + WindowsBelow(child);
  }
  return count;
}

ComPtr<IClassFactory> FactoryOf(const TestLibrary& library, REFCLSID classId) {
  ComPtr<IClassFactory> factory;
  EXPECT_EQ(
      library.Get<GetClassObject>("DllGetClassObject")(classId, IID_IClassFactory, factory.ReceiveVoid()),
      S_OK);
  return factory;
}

class Lifetime : public testing::Test {
 protected:
  HRESULT Make(REFCLSID classId, REFIID interfaceId, void** object) const {
    return FactoryOf(library_, classId)->CreateInstance(nullptr, interfaceId, object);
  }
  // The library as well as the windows that it made.
  Held Count() const {
    for (MSG message; PeekMessageW(&message, nullptr, 0, 0, PM_REMOVE);) DispatchMessageW(&message);
    Held held;
    library_.Get<CountHeld>("CountHeld")(&held);
    held.objects += WindowsBelow(nullptr) + WindowsBelow(HWND_MESSAGE);
    return held;
  }
  // Does it some times for what stays after the first time, then `times`, and looks what is left of those.
  void LeavesNothing(const char* what, int times, const std::function<void()>& work) {
    for (int i = 0; i < 3; ++i) work();
    const Held before = Count();
    for (int i = 0; i < times; ++i) work();
    const Held now = Count();
    EXPECT_EQ(now.allocations, before.allocations) << what;
    EXPECT_EQ(now.objects, before.objects) << what;
  }

  TestLibrary library_;
};

struct Class {
  const char* name;
  const CLSID& id;
};
const Class kControls[] = {{"ctrlListImage", CLSID_ctrlListImage},
                           {"ctrlThumbNailView", CLSID_ctrlThumbNailView}};

TEST_F(Lifetime, ObjectsLeaveNothing) {
  const Class classes[] = {
      {"CFileUpload", CLSID_CFileUpload}, {"CBVAccount", CLSID_CBVAccount}, kControls[0], kControls[1]};
  for (const Class& known : classes) {
    int made = 0;
    LeavesNothing(known.name, 10'000, [&] {
      ComPtr<IDispatch> object;
      ASSERT_EQ(Make(known.id, IID_IDispatch, object.ReceiveVoid()), S_OK);
      if (++made % 100 != 0) return;
      // Reads the type library, which takes much longer than all else.
      DISPID id = 0;
      LPOLESTR name = const_cast<LPOLESTR>(L"HTTPServer");
      object->GetIDsOfNames(IID_NULL, &name, 1, 0, &id);
    });
  }
}

TEST_F(Lifetime, ControlsWithWindowsAndSinksLeaveNothing) {
  // Who ends the control: the host, the host inside one of the control's events, or the form's window.
  enum class End { kHost, kHostInEvent, kWindow };
  HWND form = nullptr;
  for (const Class& known : kControls) {
    SCOPED_TRACE(known.name);
    // What is created by its class comes from the test library then.
    DWORD cookie = 0;
    ASSERT_EQ(CoRegisterClassObject(known.id, FactoryOf(library_, known.id).Get(), CLSCTX_INPROC_SERVER,
                                    REGCLS_MULTIPLEUSE, &cookie),
              S_OK);
    const auto show = [&](End end) {
      if (!IsWindow(form))
        form = CreateWindowExW(0, L"STATIC", L"form", WS_POPUP, 0, 0, 400, 300, nullptr, nullptr, nullptr,
                               nullptr);
      auto container = ComPtr<demo::ControlContainer>::Adopt(new demo::ControlContainer(form));
      ASSERT_EQ(container->Create(known.id, demo::ControlContainer::WayIn::kSteps, nullptr), S_OK);
      container->SetBounds({0, 0, 300, 200});
      ASSERT_EQ(container->Do(OLEIVERB_SHOW), S_OK);
      const HWND outer = GetWindow(form, GW_CHILD);
      const HWND list = FindWindowExW(outer, nullptr, L"SysListView32", nullptr);
      const HWND inside = list ? list : GetWindow(outer, GW_CHILD);
      if (end == End::kHostInEvent) {
        container->onEvent = [&](DISPID, std::vector<VARIANT>&) { container->Close(); };
        SendMessageW(inside, WM_KEYDOWN, VK_RETURN, 0);
        EXPECT_EQ(container->Control(), nullptr);
      }
      if (end == End::kWindow) DestroyWindow(form);
      EXPECT_EQ(container->Close(), 0U);
    };
    for (const auto& [end, times] :
         {std::pair(End::kHost, 500), {End::kHostInEvent, 20}, {End::kWindow, 20}}) {
      SCOPED_TRACE(static_cast<int>(end));
      // A form that is there at one count is there at the other.
      LeavesNothing(known.name, times, [&, end = end] { show(end); });
      WNDCLASSEXW left = {};
      left.cbSize = sizeof left;
      for (const wchar_t* name : kWindowClasses)
        EXPECT_FALSE(GetClassInfoExW(library_.Module(), name, &left));
    }
    CoRevokeClassObject(cookie);

    LeavesNothing("sinks", 1, [&] {
      ComPtr<IConnectionPointContainer> control;
      ASSERT_EQ(Make(known.id, IID_IConnectionPointContainer, control.ReceiveVoid()), S_OK);
      ComPtr<IConnectionPoint> point;
      ASSERT_EQ(control->FindConnectionPoint(IID_IPropertyNotifySink, point.Receive()), S_OK);
      auto sink = ComPtr<demo::ControlContainer>::Adopt(new demo::ControlContainer(nullptr));
      for (int i = 0; i < 10'000; ++i) {
        DWORD sunk = 0;
        ASSERT_EQ(point->Advise(static_cast<IPropertyNotifySink*>(sink.Get()), &sunk), S_OK);
        ASSERT_EQ(point->Unadvise(sunk), S_OK);
      }
    });
  }
  DestroyWindow(form);
}

// A host may list, select and ask by a control that it never shows.
TEST(ControlThatIsNotShown, HasNoWindow) {
  const auto expectNone = [](auto&& form) {
    const int before = WindowsBelow(nullptr);
    form.Open(L"*");
    EXPECT_EQ(form.Select(L"rose.jpg"), L"rose.jpg");
    EXPECT_EQ(WindowsBelow(nullptr), before);
    form.Show();
    EXPECT_GT(WindowsBelow(nullptr), before);
    EXPECT_EQ(form.Selected(), L"rose.jpg");
  };
  expectNone(Form());
  expectNone(ThumbForm());
}

// A library that is unloaded takes its window classes along, and works when it is loaded again.
TEST(Unloading, IsClean) {
  std::wstring path;
  for (int i = 0; i < 3; ++i) {
    const TestLibrary library;
    ASSERT_NE(library.Module(), nullptr);
    wchar_t file[MAX_PATH] = {};
    GetModuleFileNameW(library.Module(), file, MAX_PATH);
    path = file;
    const auto canUnload = library.Get<CanUnloadNow>("DllCanUnloadNow");
    for (const Class& known : kControls) {
      SCOPED_TRACE(known.name);
      ComPtr<IOleWindow> control;
      ASSERT_EQ(FactoryOf(library, known.id)->CreateInstance(nullptr, IID_IOleWindow, control.ReceiveVoid()),
                S_OK);
      // Makes its window.
      HWND window = nullptr;
      control->GetWindow(&window);
      EXPECT_EQ(canUnload(), S_FALSE);
    }
    EXPECT_EQ(canUnload(), S_OK);
  }
  EXPECT_EQ(GetModuleHandleW(path.c_str()), nullptr);
}

}  // namespace
}  // namespace tarnwick::test
