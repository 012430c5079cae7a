// The controls in a full container of our own, in the system's, and in none.
#include <set>

#include "Form.h"
#include "platform/windows/SystemDpi.h"

namespace tarnwick::test {
namespace {

// Where both controls are alike.
template <typename AnyForm>
class AnyControl : public testing::Test {};
using AnyForms = testing::Types<Form, ThumbForm>;
TYPED_TEST_SUITE(AnyControl, AnyForms);

TYPED_TEST(AnyControl, KeepsItsPropertiesWithTheForm) {
  const auto bag = ComPtr<PropertyBag>::Adopt(new PropertyBag);
  for (const auto wayIn : {ControlContainer::WayIn::kSteps, ControlContainer::WayIn::kQuickActivate}) {
    TypeParam form(wayIn);
    auto persist = As<IPersistPropertyBag>(*form.control);
    auto stream = As<IPersistStreamInit>(*form.control);
    EXPECT_EQ(stream->IsDirty(), S_FALSE);
    form.control->put_OLEDropMode(1);
    EXPECT_EQ(form.container->changed, std::vector<DISPID>{DISPID_OLEDropMode});
    EXPECT_EQ(stream->IsDirty(), S_OK);
    form.control->put_OLEDragMode(70000);
    EXPECT_EQ(persist->Save(bag.Get(), TRUE, FALSE), S_OK);
    EXPECT_EQ(stream->IsDirty(), S_FALSE);

    // The same through a stream, cut at every length.
    ComPtr<IStream> memory;
    CreateStreamOnHGlobal(nullptr, TRUE, memory.Receive());
    EXPECT_EQ(stream->Save(memory.Get(), TRUE), S_OK);
    ULARGE_INTEGER size = {};
    stream->GetSizeMax(&size);
    for (;; --size.QuadPart) {
      memory->SetSize(size);
      memory->Seek({}, STREAM_SEEK_SET, nullptr);
      form.control->put_OLEDropMode(9);
      const HRESULT loaded = stream->Load(memory.Get());
      SHORT mode = 0;
      form.control->get_OLEDropMode(&mode);
      EXPECT_EQ(SUCCEEDED(loaded) ? 1 : 9, mode) << size.QuadPart;
      if (size.QuadPart == 0) break;
    }
    persist = {};
    stream = {};
  }
  TypeParam form(ControlContainer::WayIn::kSteps, bag.Get());
  SHORT dropMode = 0;
  LONG dragMode = 0;
  form.control->get_OLEDropMode(&dropMode);
  form.control->get_OLEDragMode(&dragMode);
  EXPECT_EQ(dropMode, 1);
  EXPECT_EQ(dragMode, 70000);
}

TEST(ListControl, WorksWithoutAWindow) {
  const auto list = NewControl<_ctrlListImage>(CLSID_ctrlListImage);
  Bstr all(L"*");
  BSTR filter = all;
  VARIANT_BOOL done = VARIANT_FALSE;
  list->putref_mobjFileupload(nullptr);
  EXPECT_EQ(static_cast<unsigned>(list->Init(&filter, &done)), 0x800A005BU);
  EXPECT_EQ(LastDescription(), L"The control has no service client");

  EXPECT_EQ(list->putref_mobjFileupload(LoggedOnClient().Get()), S_OK);
  EXPECT_TRUE(Init(*list, L"*"));
  VARIANT names = {};
  EXPECT_EQ(list->GetFileNames(&names), S_OK);
  ASSERT_EQ(V_VT(&names), VT_ARRAY | VT_VARIANT);
  LONG last = 0;
  SafeArrayGetUBound(V_ARRAY(&names), 1, &last);
  EXPECT_EQ(last, -1);
  VariantClear(&names);
}

TEST(ListControl, FollowsItsContainer) {
  Form form;
  form.LogOn(TheServer().name);
  form.container->ambient.foreColor = RGB(1, 2, 3);
  form.container->AmbientChanged(DISPID_AMBIENT_FORECOLOR);
  form.Show();
  const struct {
    const wchar_t* face;
    SHORT weight;
    OLE_COLOR color;
    COLORREF shown;
  } rows[] = {{L"Tahoma", FW_NORMAL, RGB(200, 10, 20), RGB(200, 10, 20)},
              {L"Arial", FW_BOLD, 0x80000000 | COLOR_HIGHLIGHT, GetSysColor(COLOR_HIGHLIGHT)}};
  EXPECT_EQ(SendMessageW(form.ListWindow(), LVM_GETTEXTCOLOR, 0, 0), RGB(1, 2, 3));
  for (const auto& row : rows) {
    std::wstring face = row.face;
    FONTDESC description = {sizeof description, face.data(), {},    row.weight,
                            DEFAULT_CHARSET,    FALSE,       FALSE, FALSE};
    description.cySize.int64 = 140'000;  // ten-thousandths of a point
    ASSERT_EQ(OleCreateFontIndirect(&description, IID_IFontDisp, form.container->ambient.font.ReceiveVoid()),
              S_OK);
    form.container->ambient.foreColor = row.color;
    form.container->AmbientChanged(DISPID_UNKNOWN);
    LOGFONTW font = {};
    GetObjectW(reinterpret_cast<HFONT>(SendMessageW(form.ListWindow(), WM_GETFONT, 0, 0)), sizeof font,
               &font);
    EXPECT_STREQ(font.lfFaceName, row.face);
    EXPECT_EQ(font.lfWeight, row.weight);
    EXPECT_EQ(SendMessageW(form.ListWindow(), LVM_GETTEXTCOLOR, 0, 0), static_cast<LRESULT>(row.shown));
  }

  // 1 inch is 2540 HIMETRIC and, on this screen, 96 pixels.
  form.container->SetBounds({10, 20, 10 + 96, 20 + 192});
  RECT client = {};
  GetClientRect(form.ListWindow(), &client);
  EXPECT_TRUE(client.right > 80 && client.right <= 96) << client.right;
  auto object = As<IOleObject>(*form.list);
  SIZEL extent = {};
  EXPECT_EQ(object->GetExtent(DVASPECT_CONTENT, &extent), S_OK);
  EXPECT_TRUE(extent.cx == 2540 && extent.cy == 5080) << extent.cx << " " << extent.cy;
  EXPECT_EQ(object->GetExtent(DVASPECT_ICON, &extent), DV_E_DVASPECT);
  object = {};

  // A frozen control tells nothing until it is thawed as often.
  ComPtr<IOleControl> control = As<IOleControl>(*form.list);
  control->FreezeEvents(TRUE);
  control->FreezeEvents(TRUE);
  control->FreezeEvents(FALSE);
  form.Press(VK_RETURN);
  EXPECT_TRUE(form.events.empty());
  control->FreezeEvents(FALSE);
  form.Press(VK_RETURN);
  EXPECT_EQ(form.events, Lines{L"1024 "});
}

// A host without a container, which lets go of the control in the first event.
struct ReleasingSink final : HostObject {
  IUnknown* object = nullptr;
  ULONG left = 0;
  STDMETHODIMP Invoke(DISPID, REFIID, LCID, WORD, DISPPARAMS*, VARIANT*, EXCEPINFO*, UINT*) override {
    if (IUnknown* const last = std::exchange(object, nullptr)) left = last->Release();
    return S_OK;
  }
};

TYPED_TEST(AnyControl, MayBeReleasedInAnEventOfItsWait) {
  auto control = NewControl<typename TypeParam::Members>(TypeParam::ClassId());
  control->putref_mobjFileupload(LoggedOnClient().Get());
  EXPECT_TRUE(Init(*control, L"*"));
  Select(*control, L"rose.jpg");
  ReleasingSink sink;
  ComPtr<IConnectionPoint> point;
  DWORD cookie = 0;
  ASSERT_EQ(
      As<IConnectionPointContainer>(*control)->FindConnectionPoint(TypeParam::EventsId(), point.Receive()),
      S_OK);
  ASSERT_EQ(point->Advise(&sink, &cookie), S_OK);
  point = {};
  auto* const called = control.Detach();
  sink.object = called;
  Bstr local;
  called->DownLoadFileFromServer(Bstr(L"."), local.Receive());
  EXPECT_EQ(sink.object, nullptr) << "no event";
  EXPECT_GT(sink.left, 0U) << "gone while it ran";
  EXPECT_EQ(sink.references, 1U) << "still there afterwards";
  DeleteFileW(L"rose.jpg");
}

// Counts how often a container that draws the control itself is to draw it anew.
struct ViewSink final : IAdviseSinkEx {
  int changes = 0;
  int dataChanges = 0;
  std::function<void(const char* call)> onCall = [](const char*) {};
  STDMETHODIMP QueryInterface(REFIID id, void** object) override {
    *object = id == IID_IUnknown || id == IID_IAdviseSink ? this : nullptr;
    return *object ? S_OK : E_NOINTERFACE;
  }
  STDMETHODIMP_(ULONG) AddRef() override { return 2; }
  STDMETHODIMP_(ULONG) Release() override {
    onCall("Release");
    return 1;
  }
  STDMETHODIMP_(void) OnDataChange(FORMATETC*, STGMEDIUM*) override {
    ++dataChanges;
    onCall("OnDataChange");
  }
  STDMETHODIMP_(void) OnViewChange(DWORD, LONG) override {
    ++changes;
    onCall("OnViewChange");
  }
  STDMETHODIMP_(void) OnRename(IMoniker*) override {}
  STDMETHODIMP_(void) OnSave() override {}
  STDMETHODIMP_(void) OnClose() override { onCall("OnClose"); }
  STDMETHODIMP_(void) OnViewStatusChange(DWORD) override {}
};

// A form that keeps its values as they were once written, and gives them as they are.
struct OldBag final : IPropertyBag {
  VARIANT value = {};
  std::function<void(const char* call)> onCall = [](const char*) {};
  STDMETHODIMP QueryInterface(REFIID, void**) override { return E_NOINTERFACE; }
  STDMETHODIMP_(ULONG) AddRef() override { return 2; }
  STDMETHODIMP_(ULONG) Release() override { return 1; }
  STDMETHODIMP Read(LPCOLESTR, VARIANT* kept, IErrorLog*) override {
    onCall("Read");
    return VariantCopy(kept, &value);
  }
  STDMETHODIMP Write(LPCOLESTR, VARIANT*) override {
    onCall("Write");
    return S_OK;
  }
};

TYPED_TEST(AnyControl, TakesTheDefaultForAKeptValueThatItCannotHold) {
  TypeParam form;
  const auto bagged = As<IPersistPropertyBag>(*form.control);
  const auto modes = [&] {
    SHORT drop = 0;
    LONG drag = 0;
    form.control->get_OLEDropMode(&drop);
    form.control->get_OLEDragMode(&drag);
    return std::pair<LONG, LONG>(drop, drag);
  };
  using Modes = std::pair<LONG, LONG>;
  const Bstr word(L"abc");
  const Bstr digit(L"1");
  const auto of = [](VARTYPE type, auto set) {
    VARIANT value = {};
    V_VT(&value) = type;
    set(value);
    return value;
  };
  SAFEARRAY* const array = SafeArrayCreateVector(VT_I4, 0, 2);
  const struct {
    VARIANT kept;
    Modes modes;
  } rows[] = {
      {VariantOf(word), {0, 0}},
      {VariantOf(digit), {1, 1}},
      {VariantOf(-32768L), {-32768, -32768}},
      {VariantOf(-40000L), {0, -40000}},
      {of(VT_R8, [](VARIANT& value) { V_R8(&value) = 3e9; }), {0, 0}},
      {of(VT_BOOL, [](VARIANT& value) { V_BOOL(&value) = VARIANT_TRUE; }), {-1, -1}},
      {of(VT_ARRAY | VT_I4, [&](VARIANT& value) { V_ARRAY(&value) = array; }), {0, 0}},
      // Without a value of its own.
      {of(VT_DISPATCH, [&](VARIANT& value) { V_DISPATCH(&value) = form.container.Get(); }), {0, 0}},
      {of(VT_NULL, [](VARIANT&) {}), {0, 0}},
  };
  OldBag bag;
  for (const auto& row : rows) {
    SCOPED_TRACE(testing::Message() << V_VT(&row.kept) << " " << row.modes.second);
    form.control->put_OLEDropMode(9);
    form.control->put_OLEDragMode(9);
    bag.value = row.kept;
    EXPECT_EQ(bagged->Load(&bag, nullptr), S_OK);
    EXPECT_EQ(modes(), row.modes);
  }
  SafeArrayDestroy(array);
}

// An interface of the control that holds no reference to it.
template <typename Interface>
Interface& Uncounted(IUnknown& control) {
  return *As<Interface>(control);
}

// Whatever the control is in the middle of, the container may let go of it for good in each call that this
// brings, with all that there is to say or without a word.
TYPED_TEST(AnyControl, MayBeReleasedInsideACallOfItsContainer) {
  struct Place {
    ControlContainer& container;
    ViewSink& sink;
    OldBag& bag;
  };
  const struct {
    void (*enter)(IUnknown& control, const Place& place);
    std::size_t calls;  // of its container, of different kinds
  } rows[] = {
      {[](IUnknown& control, const Place&) { Uncounted<IOleObject>(control).Close(OLECLOSE_SAVEIFDIRTY); },
       9},
      {[](IUnknown& control, const Place&) { Uncounted<IOleObject>(control).SetClientSite(nullptr); }, 7},
      {[](IUnknown& control, const Place&) {
         Uncounted<IOleObject>(control).DoVerb(OLEIVERB_HIDE, nullptr, nullptr, 0, nullptr, nullptr);
       },
       2},
      {[](IUnknown& control, const Place& place) {
         Uncounted<IOleInPlaceObject>(control).InPlaceDeactivate();
         if (place.container.Control())
           Uncounted<IOleObject>(control).DoVerb(OLEIVERB_UIACTIVATE, nullptr, nullptr, 0, nullptr, nullptr);
       },
       10},
      {[](IUnknown& control, const Place& place) {
         QACONTAINER container = {};
         container.cbSize = sizeof container;
         container.pClientSite = &place.container;
         container.pAdviseSink = &place.sink;
         container.pPropertyNotifySink = &place.container;
         QACONTROL answer = {};
         Uncounted<IQuickActivate>(control).QuickActivate(&container, &answer);
       },
       4},
      {[](IUnknown& control, const Place& place) {
         Uncounted<IViewObject2>(control).SetAdvise(DVASPECT_CONTENT, ADVF_PRIMEFIRST, &place.sink);
       },
       3},
      {[](IUnknown& control, const Place& place) {
         Uncounted<IPersistPropertyBag>(control).Save(&place.bag, TRUE, TRUE);
         if (place.container.Control()) Uncounted<IPersistPropertyBag>(control).Load(&place.bag, nullptr);
       },
       2},
  };
  for (const auto& row : rows) {
    // First it is only seen what calls there are.
    std::vector<std::string> calls;
    for (std::size_t turn = 0; turn <= 2 * calls.size(); ++turn) {
      const std::string wanted = turn == 0 ? "" : calls[(turn - 1) / 2];
      SCOPED_TRACE(testing::Message() << &row - rows << " " << turn << " " << wanted);
      bool left = false;
      ViewSink sink;
      ViewSink dataSink;
      OldBag bag;
      TypeParam form;
      form.Show();
      form.control->put_OLEDropMode(1);
      const Place place = {*form.container, sink, bag};
      IUnknown& control = *form.container->Control();
      FORMATETC any = {CF_ENHMETAFILE, nullptr, DVASPECT_CONTENT, -1, TYMED_ENHMF};
      DWORD ignored = 0;
      Uncounted<IOleObject>(control).Advise(&sink, &ignored);
      Uncounted<IDataObject>(control).DAdvise(&any, 0, &dataSink, &ignored);
      Uncounted<IViewObject2>(control).SetAdvise(DVASPECT_CONTENT, 0, &sink);
      const HWND window = form.Window();
      form.control = {};
      form.container->onCall = sink.onCall = bag.onCall = [&](const char* call) {
        if (turn == 0 && std::find(calls.begin(), calls.end(), call) == calls.end()) calls.emplace_back(call);
        if (call != wanted || std::exchange(left, true)) return;
        if (turn % 2 == 0)
          form.container->Close();
        else
          form.container->Abandon();
      };
      // How often it is released is the system's affair.
      dataSink.onCall = [&](const char* call) {
        if (call != std::string("Release")) sink.onCall(call);
      };
      row.enter(control, place);
      EXPECT_EQ(left, turn != 0);
      // What it was given since.
      if (left) form.container->Abandon();
      form.container->onCall = sink.onCall = bag.onCall = dataSink.onCall = [](const char*) {};
      EXPECT_EQ(IsWindow(window), !left);
    }
    EXPECT_EQ(calls.size(), row.calls) << testing::PrintToString(calls);
  }
}

// A container that shows a picture of the control only, as a form in design does, or a report.
TYPED_TEST(AnyControl, DrawsItselfWithoutAWindowOfTheContainer) {
  TypeParam form;
  // Too small for all that it shows.
  form.container->SetBounds({0, 0, 200, 110});
  form.Open(L"*");
  const auto view = As<IViewObject2>(*form.control);
  constexpr std::uint32_t kBefore = RGB(255, 0, 255);
  const Pixels drawn = Drawn(320, 240, [&](HDC dc) {
    const RECT all = {0, 0, 320, 240};
    SetDCBrushColor(dc, kBefore);
    FillRect(dc, &all, static_cast<HBRUSH>(GetStockObject(DC_BRUSH)));
    const RECTL bounds = {10, 10, 310, 230};
    EXPECT_EQ(view->Draw(DVASPECT_CONTENT, -1, nullptr, nullptr, nullptr, dc, &bounds, nullptr, nullptr, 0),
              S_OK);
    EXPECT_EQ(view->Draw(DVASPECT_ICON, -1, nullptr, nullptr, nullptr, dc, &bounds, nullptr, nullptr, 0),
              DV_E_DVASPECT);
  });
  // Below the heads of the columns there are names, or pictures.
  const std::uint32_t paper = drawn[225 * 320 + 300];
  EXPECT_NE(paper, kBefore);
  EXPECT_GT(std::count_if(drawn.begin() + 320 * 40, drawn.end(),
                          [&](std::uint32_t pixel) { return pixel != paper && pixel != kBefore; }),
            400);
  const auto isBeside = [](int at) {
    return at % 320 < 10 || at % 320 >= 310 || at / 320 < 10 || at / 320 >= 230;
  };
  for (int at = 0; at < 320 * 240; ++at)
    ASSERT_TRUE(drawn[static_cast<std::size_t>(at)] == kBefore || !isBeside(at))
        << at % 320 << " " << at / 320;

  // What changes the look is told.
  ViewSink sink;
  EXPECT_EQ(view->SetAdvise(DVASPECT_CONTENT, 0, &sink), S_OK);
  ASSERT_TRUE(form.Init(L"*"));
  EXPECT_EQ(std::exchange(sink.changes, 0), 1);
  form.Select(L"coffee.jpg");
  EXPECT_EQ(std::exchange(sink.changes, 0), 1);
  Bstr name(L"coffee.jpg");
  BSTR given = name;
  VARIANT_BOOL done = VARIANT_FALSE;
  form.control->RenameFile(&given, &given, &done);
  EXPECT_EQ(std::exchange(sink.changes, 0), 1);
  EXPECT_EQ(view->SetAdvise(DVASPECT_CONTENT, 0, nullptr), S_OK);
}

TYPED_TEST(AnyControl, IsShownHiddenMovedAndDesigned) {
  TypeParam form;
  ShowWindow(form.frame, SW_SHOWNOACTIVATE);
  EXPECT_EQ(form.container->Do(OLEIVERB_SHOW), S_OK);
  const HWND window = form.Window();
  ASSERT_TRUE(IsWindowVisible(window));
  form.container->SetBounds({10, 20, 210, 140});
  RECT place = {};
  GetWindowRect(window, &place);
  MapWindowPoints(nullptr, form.frame, reinterpret_cast<POINT*>(&place), 2);
  const RECT wanted = {10, 20, 210, 140};
  EXPECT_TRUE(EqualRect(&place, &wanted)) << place.left << " " << place.top;
  EXPECT_EQ(form.container->Do(OLEIVERB_HIDE), S_OK);
  EXPECT_FALSE(IsWindowVisible(window));
  EXPECT_EQ(form.container->Do(OLEIVERB_SHOW), S_OK);
  EXPECT_TRUE(IsWindowVisible(form.Window()));

  // While it is designed, the form has the mouse and the keyboard.
  TypeParam designed;
  designed.container->ambient.userMode = false;
  designed.container->AmbientChanged(DISPID_AMBIENT_USERMODE);
  ShowWindow(designed.frame, SW_SHOWNOACTIVATE);
  EXPECT_EQ(designed.container->Do(OLEIVERB_SHOW), S_OK);
  SetFocus(designed.Window());
  EXPECT_FALSE(designed.container->IsUiActive());
}

TYPED_TEST(AnyControl, TakesTheContainersAnswerToItsActivation) {
  for (const bool atUi : {false, true})
    for (const bool closes : {false, true}) {
      SCOPED_TRACE(testing::Message() << atUi << closes);
      TypeParam form;
      ShowWindow(form.frame, SW_SHOWNOACTIVATE);
      form.container->onActivate = [&](bool ui) -> HRESULT {
        if (ui != atUi) return S_OK;
        if (!closes) return E_ACCESSDENIED;
        form.container->Close();
        return S_OK;
      };
      EXPECT_EQ(form.container->Do(OLEIVERB_UIACTIVATE), closes ? E_FAIL : E_ACCESSDENIED);
      EXPECT_FALSE(form.container->IsUiActive());
      EXPECT_EQ(form.Window() != nullptr, atUi && !closes);
    }
}

// Listens to two controls, so that the interface that it is asked for decides who hears of it.
struct SplitSink final : HostObject {
  IID eventsId = {};
  SplitSink* events = nullptr;
  int calls = 0;
  STDMETHODIMP QueryInterface(REFIID id, void** object) override {
    if (!events || id != eventsId) return HostObject::QueryInterface(id, object);
    return events->QueryInterface(IID_IDispatch, object);
  }
  STDMETHODIMP Invoke(DISPID, REFIID, LCID, WORD, DISPPARAMS*, VARIANT*, EXCEPINFO*, UINT*) override {
    ++calls;
    return S_OK;
  }
};

TYPED_TEST(AnyControl, TellsTheInterfaceThatASinkOffers) {
  TypeParam form;
  SplitSink events;
  SplitSink sink;
  sink.eventsId = TypeParam::EventsId();
  sink.events = &events;
  ComPtr<IConnectionPointContainer> points = As<IConnectionPointContainer>(*form.control);
  ComPtr<IConnectionPoint> point;
  ASSERT_EQ(points->FindConnectionPoint(TypeParam::EventsId(), point.Receive()), S_OK);
  DWORD cookie = 0;
  ASSERT_EQ(point->Advise(&sink, &cookie), S_OK);
  Bstr refused(L"#");
  BSTR given = refused;
  VARIANT_BOOL valid = VARIANT_TRUE;
  form.control->IsFileNameValid(&given, &valid);
  EXPECT_EQ(events.calls, 1);
  EXPECT_EQ(sink.calls, 0);
  EXPECT_EQ(point->Unadvise(cookie), S_OK);
  point = {};
  ASSERT_EQ(points->FindConnectionPoint(IID_IPropertyNotifySink, point.Receive()), S_OK);
  EXPECT_EQ(point->Advise(&sink, &cookie), CONNECT_E_CANNOTCONNECT);
  const bool isList = TypeParam::EventsId() == DIID___ctrlListImage;
  EXPECT_NE(
      points->FindConnectionPoint(isList ? DIID___ctrlThumbNailView : DIID___ctrlListImage, point.Receive()),
      S_OK);
  // As a host's designer sees them.
  ComPtr<ITypeInfo> itsClass;
  TYPEATTR* attributes = nullptr;
  ASSERT_EQ(As<IProvideClassInfo>(*form.control)->GetClassInfo(itsClass.Receive()), S_OK);
  ASSERT_EQ(itsClass->GetTypeAttr(&attributes), S_OK);
  EXPECT_EQ(attributes->guid, TypeParam::ClassId());
  itsClass->ReleaseTypeAttr(attributes);
}

// What both controls answer about files, each late bound, with the last argument first.
TYPED_TEST(AnyControl, AnswersAboutNamesAndFiles) {
  TypeParam form;
  form.Open(L"jpg");
  const auto truth = [&](const wchar_t* member, std::initializer_list<VARIANT> arguments) {
    const VARIANT answer = Call(form.control.Get(), member, arguments);
    return V_VT(&answer) == VT_BOOL ? V_BOOL(&answer) : 9;
  };
  VARIANT_BOOL enabled = VARIANT_TRUE;
  EXPECT_EQ(truth(L"EnableRename", {ReferenceTo(VT_BOOL, &enabled)}), VARIANT_TRUE);
  const Bstr valid(L"b c.jpg");
  EXPECT_EQ(truth(L"IsFileNameValid", {VariantOf(valid)}), VARIANT_TRUE);
  BSTR name = SysAllocString(L"a.gif");
  const Bstr extension(L".jpg");
  BSTR itsExtension = extension;
  EXPECT_EQ(truth(L"CheckFileExtension", {ReferenceTo(VT_BSTR, &itsExtension), ReferenceTo(VT_BSTR, &name)}),
            VARIANT_TRUE);
  EXPECT_STREQ(name, L"a.jpg");
  SysFreeString(name);
  const Bstr taken(L"COFFEE.jpg");
  EXPECT_EQ(truth(L"CheckIfFileDoesNotExist", {VariantOf(taken)}), VARIANT_FALSE);
  EXPECT_EQ(truth(L"CheckIfFileDoesNotExist", {VariantOf(valid)}), VARIANT_TRUE);
  ComPtr<IDispatch> files;
  const Bstr coffee(L"coffee.jpg");
  Call(form.control.Get(), L"GetFileDetails", {ReferenceTo(VT_DISPATCH, files.Receive()), VariantOf(coffee)});
  EXPECT_EQ(Told(files.Get(), L"Count"), L"1");
  Select(*form.control, coffee);
  EXPECT_EQ(Told(form.control.Get(), L"GetSelectedFilesHttpPath"), Address(L"coffee.jpg"));
}

// A container's addition to a control, and the control as a part of it.
class Whole final : public IUnknown {
 public:
  explicit Whole(bool& ended) : ended_(ended) {}
  HRESULT Make(REFCLSID classId) {
    return CoCreateInstance(classId, this, CLSCTX_INPROC_SERVER, IID_IUnknown, part_.ReceiveVoid());
  }
  STDMETHODIMP QueryInterface(REFIID id, void** object) override {
    if (id != IID_IUnknown) return part_->QueryInterface(id, object);
    *object = this;
    AddRef();
    return S_OK;
  }
  STDMETHODIMP_(ULONG) AddRef() override { return ++references_; }
  STDMETHODIMP_(ULONG) Release() override {
    const ULONG left = --references_;
    if (left == 0) {
      // The part may still ask and count it while it ends.
      references_ = 1000;
      delete this;
    }
    return left;
  }

 private:
  ~Whole() { ended_ = true; }

  ULONG references_ = 1;
  bool& ended_;
  ComPtr<IUnknown> part_;
};

TYPED_TEST(AnyControl, CanBePartOfAnotherObject) {
  ComPtr<IUnknown> refused;
  bool ended = false;
  auto whole = ComPtr<Whole>::Adopt(new Whole(ended));
  EXPECT_EQ(CoCreateInstance(TypeParam::ClassId(), whole.Get(), CLSCTX_INPROC_SERVER, IID_IDispatch,
                             refused.ReceiveVoid()),
            CLASS_E_NOAGGREGATION);
  ASSERT_EQ(whole->Make(TypeParam::ClassId()), S_OK);
  auto control = As<IDispatch>(*whole);
  EXPECT_EQ(As<IUnknown>(*control).Get(), static_cast<IUnknown*>(whole.Get()));

  TypeParam form;
  const auto container = ComPtr<ControlContainer>::Adopt(new ControlContainer(form.frame));
  int events = 0;
  container->onEvent = [&](DISPID, std::vector<VARIANT>&) { ++events; };
  ASSERT_EQ(container->TakeUp(*whole.Get(), ControlContainer::WayIn::kSteps), S_OK);
  whole = {};
  ShowWindow(form.frame, SW_SHOWNOACTIVATE);
  EXPECT_EQ(container->Do(OLEIVERB_UIACTIVATE), S_OK);
  const HWND window = GetWindow(form.frame, GW_CHILD);
  EXPECT_TRUE(IsWindowVisible(window));
  Call(control.Get(), L"IsFileNameValid", {VariantOf(Bstr(L"#"))});
  EXPECT_EQ(events, 1);
  control = {};
  EXPECT_FALSE(ended);
  EXPECT_EQ(container->Close(), 0U);
  EXPECT_TRUE(ended);
  EXPECT_FALSE(IsWindow(window));
  EXPECT_TRUE(container->violations.empty());
}

// With what the system offers for documents.
TYPED_TEST(AnyControl, CanBeKeptInADocument) {
  ComPtr<IStorage> storage;
  constexpr DWORD kMode = STGM_CREATE | STGM_READWRITE | STGM_SHARE_EXCLUSIVE | STGM_DELETEONRELEASE;
  ASSERT_EQ(StgCreateDocfile(nullptr, kMode, 0, storage.Receive()), S_OK);
  ComPtr<IPersistStorage> object;
  ASSERT_EQ(OleCreate(TypeParam::ClassId(), IID_IPersistStorage, OLERENDER_NONE, nullptr, nullptr,
                      storage.Get(), object.ReceiveVoid()),
            S_OK);
  auto control = As<typename TypeParam::Members>(*object);
  control->put_OLEDropMode(2);
  EXPECT_EQ(object->IsDirty(), S_OK);
  EXPECT_EQ(OleSave(object.Get(), storage.Get(), TRUE), S_OK);
  EXPECT_EQ(object->SaveCompleted(nullptr), S_OK);
  EXPECT_EQ(object->IsDirty(), S_FALSE);
  control = {};
  object = {};

  ComPtr<IDataObject> data;
  ASSERT_EQ(OleLoad(storage.Get(), IID_IDataObject, nullptr, data.ReceiveVoid()), S_OK);
  control = As<typename TypeParam::Members>(*data);
  short mode = 0;
  control->get_OLEDropMode(&mode);
  EXPECT_EQ(mode, 2);

  const ComPtr<_CFileUpload> client = LoggedOnClient();
  EXPECT_TRUE(Init(*control, L"gif"));
  // What it looks like, as data.
  ComPtr<IEnumFORMATETC> formats;
  ASSERT_EQ(data->EnumFormatEtc(DATADIR_GET, formats.Receive()), S_OK);
  int count = 0;
  for (FORMATETC format; formats->Next(1, &format, nullptr) == S_OK; ++count) {
    STGMEDIUM medium = {};
    ASSERT_EQ(data->GetData(&format, &medium), S_OK);
    const Pixels played = Drawn(300, 200, [&](HDC dc) {
      const RECT all = {0, 0, 300, 200};
      if (medium.tymed == TYMED_ENHMF) {
        PlayEnhMetaFile(dc, medium.hEnhMetaFile, &all);
        return;
      }
      const auto* const picture = static_cast<const METAFILEPICT*>(GlobalLock(medium.hMetaFilePict));
      SetMapMode(dc, picture->mm);
      SetViewportExtEx(dc, 300, 200, nullptr);
      PlayMetaFile(dc, picture->hMF);
      GlobalUnlock(medium.hMetaFilePict);
    });
    EXPECT_GT(std::set(played.begin(), played.end()).size(), 5U) << format.cfFormat;
    ReleaseStgMedium(&medium);
  }
  EXPECT_EQ(count, 2);
  FORMATETC text = {CF_TEXT, nullptr, DVASPECT_CONTENT, -1, TYMED_HGLOBAL};
  EXPECT_EQ(data->QueryGetData(&text), DV_E_FORMATETC);

  ViewSink sink;
  DWORD cookie = 0;
  FORMATETC any = {CF_ENHMETAFILE, nullptr, DVASPECT_CONTENT, -1, TYMED_ENHMF};
  EXPECT_EQ(data->DAdvise(&any, 0, &sink, &cookie), S_OK);
  control->ChangeFileFilter(Bstr(L"gif"));
  EXPECT_EQ(sink.dataChanges, 1);
  EXPECT_EQ(data->DUnadvise(cookie), S_OK);
}

std::vector<HWND> StopsOf(const Form& form) {
  return {form.ListWindow()};
}
std::vector<HWND> StopsOf(const ThumbForm& form) {
  return {form.Grid(), form.ScrollBar(), FindWindowExW(form.Window(), nullptr, L"BUTTON", L"List view")};
}

// The window of a form whose loop only dispatches: Tab that arrives there goes on to the window in `next`.
LRESULT CALLBACK TabProc(HWND window, UINT message, WPARAM wParam, LPARAM lParam, UINT_PTR, DWORD_PTR next) {
  if (message == WM_KEYDOWN && wParam == VK_TAB) SetFocus(reinterpret_cast<HWND>(next));
  return DefSubclassProc(window, message, wParam, lParam);
}

TYPED_TEST(AnyControl, IsPartOfTheTabOrderOfItsForm) {
  TypeParam form;
  form.Open(L"*");
  const HWND button = CreateWindowExW(0, L"BUTTON", L"other", WS_CHILD | WS_VISIBLE | WS_TABSTOP, 0, 0, 9, 9,
                                      form.frame, nullptr, nullptr, nullptr);
  ShowWindow(form.frame, SW_SHOWNOACTIVATE);
  ASSERT_EQ(form.container->Do(OLEIVERB_INPLACEACTIVATE), S_OK);
  EXPECT_FALSE(form.container->IsUiActive());
  std::vector<HWND> stops = StopsOf(form);
  ASSERT_TRUE(SetWindowSubclass(form.frame, TabProc, 1, reinterpret_cast<DWORD_PTR>(button)));
  // Some hosts pass keys to the control, others only run a dialog's loop, and some do neither.
  enum Loop { kPassesKeys, kDialog, kDispatches };
  for (const Loop loop : {kPassesKeys, kDialog, kDispatches})
    for (const bool backward : {false, true}) {
      SCOPED_TRACE(testing::Message() << loop << backward);
      const auto tab = [&] {
        MSG message = {GetFocus(), WM_KEYDOWN, VK_TAB, 0, 0, {0, 0}};
        if (loop == kDispatches)
          DispatchMessageW(&message);
        else if (loop == kDialog || !form.container->TranslateKey(message))
          IsDialogMessageW(form.frame, &message);
      };
      if (backward) Hold(VK_SHIFT, true);
      SetFocus(button);
      for (const HWND stop : stops) {
        if (loop == kDispatches && GetFocus() == button)
          SetFocus(stop);
        else
          tab();
        EXPECT_EQ(GetFocus(), stop);
        EXPECT_TRUE(form.container->IsUiActive());
        EXPECT_TRUE(form.container->HasFocus());
      }
      tab();
      EXPECT_EQ(GetFocus(), button);
      EXPECT_FALSE(form.container->HasFocus());
      if (backward) Hold(VK_SHIFT, false);
      std::reverse(stops.begin(), stops.end());
    }
}

HWND EditorOf(const Form& form) {
  return reinterpret_cast<HWND>(SendMessageW(form.ListWindow(), LVM_GETEDITCONTROL, 0, 0));
}
HWND EditorOf(const ThumbForm& form) {
  return IsWindowVisible(form.Editor()) ? form.Editor() : nullptr;
}

TYPED_TEST(AnyControl, UploadsRenamesInPlaceAndDeletes) {
  TypeParam form;
  form.Show();
  form.Open(L"jpg");
  CopyFileW(L"demo\\pictures\\rose.jpg", L"label test.jpg", FALSE);
  ASSERT_TRUE(form.Upload(L".\\label test.jpg"));
  DeleteFileW(L"label test.jpg");
  const struct {
    const wchar_t* typed;
    WPARAM key;           // that ends it
    const wchar_t* code;  // of the event
    const wchar_t* name;  // afterwards
  } rows[] = {
      {L"other.jpg", VK_ESCAPE, L"", L"label test.jpg"},
      {L"a#b.jpg", VK_RETURN, L"1034", L"label test.jpg"},
      // Shown in another way, but edited as it is.
      {L"a\u202Egpj.gif", VK_RETURN, L"1031", L"a\u202Egpj.jpg"},
      {L"l\u00E4bel & two.gif", VK_RETURN, L"1031", L"l\u00E4bel & two.jpg"},
  };
  // While a name is edited all keys are the editor's.
  int offers = 0;
  form.container->onKey = [&](const MSG& message, DWORD) {
    offers += message.message == WM_KEYDOWN && message.wParam != VK_F2 ? 1 : 0;
    return false;
  };
  form.Press(VK_F2);
  EXPECT_EQ(EditorOf(form), nullptr) << "it is not allowed";
  form.control->put_bRenameEnabled(VARIANT_TRUE);
  for (const auto& row : rows) {
    SCOPED_TRACE(testing::Message() << row.typed);
    form.Press(VK_F2);
    const HWND editor = EditorOf(form);
    ASSERT_NE(editor, nullptr);
    // The form may activate the control once more.
    EXPECT_EQ(form.container->Do(OLEIVERB_UIACTIVATE), S_OK);
    EXPECT_EQ(GetFocus(), editor);
    form.events.clear();
    // All of the name is selected.
    EXPECT_EQ(TextOf(editor), form.Selected());
    form.Press(VK_DELETE, editor);
    EXPECT_EQ(TextOf(editor), L"");
    for (const wchar_t* letter = row.typed; *letter; ++letter)
      SendMessageW(editor, WM_CHAR, static_cast<WPARAM>(*letter), 0);
    form.Press(row.key, editor);
    form.Pump();
    EXPECT_EQ(EditorOf(form), nullptr);
    EXPECT_EQ(form.events.empty() ? L"" : form.events.at(0).substr(0, 4), row.code);
    EXPECT_EQ(form.Selected(), row.name);
  }
  EXPECT_EQ(offers, 0);
  // The focus leaves the control from the editor, too.
  form.Press(VK_F2);
  EXPECT_TRUE(form.container->HasFocus());
  SetFocus(form.frame);
  EXPECT_FALSE(form.container->HasFocus());
  EXPECT_EQ(EditorOf(form), nullptr);
  // The server has it under the new name.
  form.Open(L"jpg");
  EXPECT_EQ(form.Select(rows[3].name), rows[3].name);
  form.events.clear();
  form.control->DeleteFile();
  EXPECT_EQ(std::count(form.events.begin(), form.events.end(), L"1001 "), 1);
  form.Open(L"jpg");
  EXPECT_NE(form.Select(rows[3].name), rows[3].name);
}

int MeasureOf(const Form& form) {
  return static_cast<int>(SendMessageW(form.ListWindow(), LVM_GETCOLUMNWIDTH, 0, 0));
}
int MeasureOf(const ThumbForm& form) {
  RECT slot = {};
  GetClientRect(form.Slot(1), &slot);
  return slot.right;
}

// A program that knows nothing of screens has windows of 96 dots per inch on any screen. Moved there, a
// control of a program that does looks like one that has never been elsewhere.
TYPED_TEST(AnyControl, FollowsTheScreenOfItsWindow) {
  const auto set = reinterpret_cast<HANDLE(WINAPI*)(HANDLE)>(reinterpret_cast<void*>(
      GetProcAddress(GetModuleHandleW(L"user32.dll"), "SetThreadDpiAwarenessContext")));
  const int dpi = SystemDpi();
  if (!set || dpi == 96) GTEST_SKIP() << "needs a finer screen";
  constexpr int kSize = 400;
  const auto kUnaware = reinterpret_cast<HANDLE>(-1);
  const auto kSystemAware = reinterpret_cast<HANDLE>(-2);
  const auto draw = [&](ControlContainer& container) {
    container.SetBounds({0, 0, kSize, kSize});
    EXPECT_EQ(container.Do(OLEIVERB_UIACTIVATE), S_OK);
    const auto view = As<IViewObject2>(*container.Control());
    return Drawn(kSize, kSize, [&](HDC dc) {
      constexpr RECTL kAll = {0, 0, kSize, kSize};
      EXPECT_EQ(view->Draw(DVASPECT_CONTENT, -1, nullptr, nullptr, nullptr, dc, &kAll, nullptr, nullptr, 0),
                S_OK);
    });
  };

  const HANDLE before = set(kUnaware);
  TypeParam native;
  native.LogOn(TheServer().name);
  native.Show();
  ASSERT_TRUE(native.Init(L"*"));
  const Pixels expected = draw(*native.container);
  const int measure = MeasureOf(native);

  set(kSystemAware);
  TypeParam form;
  form.Show();
  form.Open(L"*");
  const Pixels fine = draw(*form.container);
  EXPECT_FALSE(fine == expected);
  EXPECT_NEAR(MeasureOf(form), MulDiv(measure, dpi, 96), 1);
  form.container->Close();

  const auto moved = ComPtr<ControlContainer>::Adopt(new ControlContainer(native.frame));
  ASSERT_EQ(moved->TakeUp(*form.control, ControlContainer::WayIn::kSteps), S_OK);
  set(kUnaware);
  EXPECT_TRUE(draw(*moved) == expected);
  EXPECT_EQ(MeasureOf(form), measure);
  set(kSystemAware);
  moved->Close();

  ASSERT_EQ(form.container->TakeUp(*form.control, ControlContainer::WayIn::kSteps), S_OK);
  EXPECT_TRUE(draw(*form.container) == fine);
  set(before);
}

// Every version of the system's container for controls, each with a window class of its own.
TYPED_TEST(AnyControl, LivesInTheSystemsContainers) {
  for (const std::wstring version : {L"", L"80", L"90", L"100", L"110"}) {
    SCOPED_TRACE(std::string(version.begin(), version.end()));
    const HMODULE library = LoadLibraryW((L"atl" + version + L".dll").c_str());
    ASSERT_NE(library, nullptr);
    const auto init =
        reinterpret_cast<BOOL(WINAPI*)()>(reinterpret_cast<void*>(GetProcAddress(library, "AtlAxWinInit")));
    const auto get = reinterpret_cast<HRESULT(WINAPI*)(HWND, IUnknown**)>(
        reinterpret_cast<void*>(GetProcAddress(library, "AtlAxGetControl")));
    ASSERT_TRUE(init && get);
    init();  // false when the class is there already
    const HWND window = CreateWindowExW(0, (L"AtlAxWin" + version).c_str(), TypeParam::kProgId, WS_POPUP, 0,
                                        0, 300, 200, nullptr, nullptr, nullptr, nullptr);
    ASSERT_NE(window, nullptr);
    ShowWindow(window, SW_SHOWNOACTIVATE);
    ComPtr<IUnknown> control;
    ASSERT_EQ(get(window, control.Receive()), S_OK);
    EXPECT_TRUE(As<typename TypeParam::Members>(*control));
    HWND inner = nullptr;
    EXPECT_EQ(As<IOleWindow>(*control)->GetWindow(&inner), S_OK);
    EXPECT_TRUE(IsChild(window, inner));
    MoveWindow(window, 0, 0, 200, 150, TRUE);
    RECT place = {};
    GetClientRect(inner, &place);
    EXPECT_EQ(place.right, 200);
    EXPECT_EQ(place.bottom, 150);
    control = {};
    DestroyWindow(window);
    EXPECT_FALSE(IsWindow(inner));
  }
}

}  // namespace
}  // namespace tarnwick::test
