// The thumbnail control as the type library describes it: each member by its name, the fields through the
// interface as well, and the events.
#include <set>
#include <type_traits>

#include "Form.h"

namespace tarnwick::test {
namespace {

template <typename Value>
VARIANT VariantWith(VARTYPE type, Value value) {
  VARIANT variant = {};
  V_VT(&variant) = type;
  std::memcpy(&V_I4(&variant), &value, sizeof value);  // NOLINT(bugprone-sizeof-expression): may be a pointer
  return variant;
}

class Members {
 public:
  explicit Members(_ctrlThumbNailView* control) : control_(control) {}

  // The last argument first.
  VARIANT Call(const wchar_t* name, std::initializer_list<VARIANT> arguments = {}) {
    called_.insert(name);
    return test::Call(control_, name, arguments);
  }
  void Put(const wchar_t* name, VARIANT value, WORD how = DISPATCH_PROPERTYPUT) {
    called_.insert(name);
    std::wstring text = name;
    LPOLESTR names = text.data();
    DISPID id = 0;
    DISPID put = DISPID_PROPERTYPUT;
    DISPPARAMS parameters = {&value, &put, 1, 1};
    EXPECT_EQ(control_->GetIDsOfNames(IID_NULL, &names, 1, LOCALE_USER_DEFAULT, &id), S_OK);
    EXPECT_EQ(
        control_->Invoke(id, IID_NULL, LOCALE_USER_DEFAULT, how, &parameters, nullptr, nullptr, nullptr),
        S_OK);
  }
  // Written on one way, a field is read on the other.
  template <typename Value>
  void ExpectField(const wchar_t* name, VARTYPE type,
                   HRESULT (STDMETHODCALLTYPE _ctrlThumbNailView::*put)(Value),
                   HRESULT (STDMETHODCALLTYPE _ctrlThumbNailView::*get)(Value*),
                   std::type_identity_t<Value> first, std::type_identity_t<Value> second) {
    SCOPED_TRACE(testing::Message() << name);
    const auto expect = [&](VARIANT read, Value written) {
      VARIANT expected = VariantWith(type, written);
      EXPECT_EQ(V_VT(&read), type);
      EXPECT_EQ(VarCmp(&read, &expected, LOCALE_USER_DEFAULT, 0), static_cast<HRESULT>(VARCMP_EQ));
      VariantClear(&read);
    };
    EXPECT_EQ((control_->*put)(first), S_OK);
    expect(Call(name), first);
    Put(name, VariantWith(type, second));
    Value value = {};
    EXPECT_EQ((control_->*get)(&value), S_OK);
    expect(VariantWith(type, value), second);
  }
  // Members of the type library that were not called.
  std::set<std::wstring> Missing() const {
    std::set<std::wstring> missing;
    ComPtr<ITypeInfo> info;
    EXPECT_EQ(control_->GetTypeInfo(0, LOCALE_USER_DEFAULT, info.Receive()), S_OK);
    FUNCDESC* member = nullptr;
    for (UINT i = 0; info->GetFuncDesc(i, &member) == S_OK; ++i) {
      Bstr name;
      UINT count = 0;
      info->GetNames(member->memid, name.Receive(), 1, &count);
      // IDispatch's own are restricted.
      if (!(member->wFuncFlags & FUNCFLAG_FRESTRICTED) && !called_.contains(name.Text()))
        missing.insert(name.Text());
      info->ReleaseFuncDesc(member);
    }
    return missing;
  }

 private:
  _ctrlThumbNailView* control_;
  std::set<std::wstring> called_;
};

TEST(ThumbNailControl, HasItsMembersOnBothWays) {
  ThumbForm form;
  form.LogOn(TheServer().name);
  form.Show();
  Members members(form.control.Get());
  using Control = _ctrlThumbNailView;
  const auto text = [&](const wchar_t* name, auto put, auto get) {
    const Bstr first(L"one \u00FC");
    const Bstr second;
    members.ExpectField(name, VT_BSTR, put, get, first, second);
  };
  // Left as false: one of them ends the next transfer.
  const auto boolean = [&](const wchar_t* name, auto put, auto get) {
    members.ExpectField(name, VT_BOOL, put, get, VARIANT_TRUE, VARIANT_FALSE);
  };
  members.ExpectField(L"m_LastError", VT_I4, &Control::put_m_LastError, &Control::get_m_LastError,
                      static_cast<FtpErrors>(5), static_cast<FtpErrors>(7));
  members.ExpectField(L"m_intLocalFileID", VT_I2, &Control::put_m_intLocalFileID,
                      &Control::get_m_intLocalFileID, -5, 300);
  members.ExpectField(L"m_lUploadedBytes", VT_I4, &Control::put_m_lUploadedBytes,
                      &Control::get_m_lUploadedBytes, 70'000, -1);
  members.ExpectField(L"iImgNo", VT_I2, &Control::put_iImgNo, &Control::get_iImgNo, 3, 1);
  members.ExpectField(L"OLEDropMode", VT_I2, &Control::put_OLEDropMode, &Control::get_OLEDropMode, 1, 2);
  members.ExpectField(L"OLEDragMode", VT_I4, &Control::put_OLEDragMode, &Control::get_OLEDragMode, 70'000, 1);
  text(L"m_strLastErrorDesc", &Control::put_m_strLastErrorDesc, &Control::get_m_strLastErrorDesc);
  text(L"m_strWinsockBuffer", &Control::put_m_strWinsockBuffer, &Control::get_m_strWinsockBuffer);
  text(L"m_strDataBuffer", &Control::put_m_strDataBuffer, &Control::get_m_strDataBuffer);
  text(L"m_strLocalFilePath", &Control::put_m_strLocalFilePath, &Control::get_m_strLocalFilePath);
  text(L"m_strLastServerResponse", &Control::put_m_strLastServerResponse,
       &Control::get_m_strLastServerResponse);
  text(L"gszDownloadPath", &Control::put_gszDownloadPath, &Control::get_gszDownloadPath);
  boolean(L"m_bTransferInProgress", &Control::put_m_bTransferInProgress, &Control::get_m_bTransferInProgress);
  boolean(L"m_bUploadFile", &Control::put_m_bUploadFile, &Control::get_m_bUploadFile);
  boolean(L"m_bFileIsOpened", &Control::put_m_bFileIsOpened, &Control::get_m_bFileIsOpened);
  boolean(L"gbUploadImage", &Control::put_gbUploadImage, &Control::get_gbUploadImage);
  boolean(L"gbConnectionFailed", &Control::put_gbConnectionFailed, &Control::get_gbConnectionFailed);
  boolean(L"gbDownload", &Control::put_gbDownload, &Control::get_gbDownload);
  boolean(L"bRenameEnabled", &Control::put_bRenameEnabled, &Control::get_bRenameEnabled);
  boolean(L"bConnectedToFtp", &Control::put_bConnectedToFtp, &Control::get_bConnectedToFtp);
  const ComPtr<_CFileUpload> client = LoggedOnClient();
  for (const WORD how : {WORD{DISPATCH_PROPERTYPUT}, WORD{DISPATCH_PROPERTYPUTREF}}) {
    form.control->putref_mobjFileupload(NewClient().Get());
    members.Put(L"mobjFileupload", VariantWith(VT_DISPATCH, static_cast<IDispatch*>(client.Get())), how);
    VARIANT same = members.Call(L"mobjFileupload");
    EXPECT_EQ(V_DISPATCH(&same), client.Get());
    VariantClear(&same);
  }

  // A reference to a text, the text itself, and what was made of it.
  const auto withText = [&](const wchar_t* name, const wchar_t* argument) {
    Bstr owned(argument);
    BSTR given = SysAllocString(owned);
    const VARIANT answer = members.Call(name, {VariantWith(VT_BYREF | VT_BSTR, &given)});
    EXPECT_STREQ(given, argument);
    SysFreeString(given);
    return answer;
  };
  const auto truth = [](const VARIANT& answer) {
    EXPECT_EQ(V_VT(&answer), VT_BOOL);
    return V_BOOL(&answer) != VARIANT_FALSE;
  };
  const auto nothing = [](const VARIANT& answer) { EXPECT_EQ(V_VT(&answer), VT_EMPTY); };
  const auto word = [](VARIANT answer) {
    std::wstring owned = V_VT(&answer) == VT_BSTR ? V_BSTR(&answer) : L"no text";
    VariantClear(&answer);
    return owned;
  };
  EXPECT_TRUE(truth(withText(L"Init", L"jpg")));
  EXPECT_EQ(form.Captions(), kJpegs);
  nothing(withText(L"UploadedFileSetFocus", L"coffee.jpg"));
  EXPECT_EQ(word(members.Call(L"SelectedFileName")), L"coffee.jpg");
  EXPECT_EQ(word(members.Call(L"GetSelectedFilesHttpPath")), Address(L"coffee.jpg"));
  SetFocus(form.frame);
  nothing(members.Call(L"PictureSetFocus"));
  EXPECT_EQ(GetFocus(), form.Grid());
  for (const VARIANT_BOOL enabled : {VARIANT_TRUE, VARIANT_FALSE}) {
    VARIANT_BOOL given = enabled;
    EXPECT_EQ(truth(members.Call(L"EnableRename", {VariantWith(VT_BYREF | VT_BOOL, &given)})),
              enabled != VARIANT_FALSE);
  }
  EXPECT_FALSE(truth(members.Call(L"EditFileLabel")));
  nothing(withText(L"SetLabelText", L"Tom & Jerry"));
  EXPECT_EQ(TextOf(form.Slot(2)), L"Tom && Jerry");
  VARIANT key = VariantOf(LONG{1});
  const VARIANT keys = VariantWith(VT_BYREF | VT_VARIANT, &key);
  const VARIANT overlay = members.Call(L"Overlay", {keys, keys});
  EXPECT_EQ(V_VT(&overlay), VT_DISPATCH);
  EXPECT_EQ(V_DISPATCH(&overlay), nullptr);

  form.events.clear();
  EXPECT_TRUE(truth(withText(L"IsFileNameValid", L"b c.jpg")));
  EXPECT_FALSE(truth(withText(L"IsFileNameValid", L"b%c.jpg")));
  nothing(withText(L"ValidateFileName", L"coffee.jpg"));
  EXPECT_EQ(form.events, (Lines{L"1034 ", L"1031 "}));
  BSTR name = SysAllocString(L"a.gif");
  const Bstr extension(L".jpg");
  BSTR itsExtension = extension;
  EXPECT_TRUE(truth(members.Call(L"CheckFileExtension", {VariantWith(VT_BYREF | VT_BSTR, &itsExtension),
                                                         VariantWith(VT_BYREF | VT_BSTR, &name)})));
  EXPECT_STREQ(name, L"a.jpg");
  SysFreeString(name);

  const Bstr taken(L"COFFEE.jpg");
  const Bstr unknown(L"unknown.jpg");
  EXPECT_FALSE(truth(members.Call(L"CheckIfFileDoesNotExist", {VariantOf(taken)})));
  EXPECT_TRUE(truth(members.Call(L"CheckIfFileDoesNotExist", {VariantOf(unknown)})));
  IDispatch* files = nullptr;
  const Bstr coffee(L"coffee.jpg");
  nothing(members.Call(L"GetFileDetails", {VariantWith(VT_BYREF | VT_DISPATCH, &files), VariantOf(coffee)}));
  ASSERT_TRUE(files);
  VARIANT record = Call(files, L"Item", {VariantOf(LONG{1})});
  EXPECT_EQ(word(Call(V_DISPATCH(&record), L"FileName", {})), L"coffee.jpg");
  VariantClear(&record);
  files->Release();

  const Bstr here(L".");
  EXPECT_EQ(word(members.Call(L"DownLoadFileFromServer", {VariantOf(here)})), L".\\coffee.jpg");
  EXPECT_TRUE(Contents(L"coffee.jpg") == Contents(L"demo\\pictures\\coffee.jpg"));
  DeleteFileW(L"coffee.jpg");
  EXPECT_FALSE(truth(members.Call(L"UploadImage", {VariantOf(unknown)})));
  form.events.clear();
  BSTR from = unknown;
  BSTR to = here;
  EXPECT_FALSE(truth(members.Call(
      L"RenameFile", {VariantWith(VT_BYREF | VT_BSTR, &to), VariantWith(VT_BYREF | VT_BSTR, &from)})));
  nothing(members.Call(L"ChangeFileFilter", {VariantOf(here)}));
  EXPECT_EQ(form.Captions(), Lines());
  nothing(members.Call(L"DeleteFile"));
  EXPECT_EQ(form.events, (Lines{L"1033 ", L"1002 "}));
  std::wstring told;
  form.onOther = [&](DISPID event, std::vector<VARIANT>&) {
    if (event == kOLEStartDrag) keybd_event(VK_ESCAPE, 0, 0, 0);
    if (event == kOLEStartDrag || event == kOLECompleteDrag) told += std::to_wstring(event);
  };
  nothing(members.Call(L"OLEDrag"));
  keybd_event(VK_ESCAPE, 0, KEYEVENTF_KEYUP, 0);
  form.Pump();
  EXPECT_EQ(told, L"27");
  EXPECT_EQ(members.Missing(), std::set<std::wstring>());
}

TEST(ThumbNailControl, TellsItsEventsThroughItsOwnInterface) {
  const ThumbForm form;
  ComPtr<IConnectionPointContainer> points;
  ComPtr<IConnectionPoint> point;
  ASSERT_EQ(form.control->QueryInterface(IID_IConnectionPointContainer, points.ReceiveVoid()), S_OK);
  EXPECT_NE(points->FindConnectionPoint(DIID___ctrlListImage, point.Receive()), S_OK);
  EXPECT_EQ(points->FindConnectionPoint(DIID___ctrlThumbNailView, point.Receive()), S_OK);
  // As a host's designer sees them.
  ComPtr<IProvideClassInfo> provider;
  ComPtr<ITypeInfo> itsClass;
  ComPtr<ITypeInfo> events;
  ASSERT_EQ(form.control->QueryInterface(IID_IProvideClassInfo, provider.ReceiveVoid()), S_OK);
  ASSERT_EQ(provider->GetClassInfo(itsClass.Receive()), S_OK);
  HREFTYPE type = 0;
  INT flags = 0;
  ASSERT_EQ(itsClass->GetImplTypeFlags(1, &flags), S_OK);
  EXPECT_EQ(flags, IMPLTYPEFLAG_FDEFAULT | IMPLTYPEFLAG_FSOURCE);
  ASSERT_EQ(itsClass->GetRefTypeOfImplType(1, &type), S_OK);
  ASSERT_EQ(itsClass->GetRefTypeInfo(type, events.Receive()), S_OK);
  Lines names;
  for (MEMBERID id = 1;; ++id) {
    Bstr name;
    UINT count = 0;
    if (events->GetNames(id, name.Receive(), 1, &count) != S_OK) break;
    names.push_back(name.Text());
  }
  EXPECT_EQ(names, (Lines{L"FileManagerEvent", L"OLEStartDrag", L"OLESetData", L"OLEGiveFeedback",
                          L"OLEDragOver", L"OLEDragDrop", L"OLECompleteDrag", L"StateChanged",
                          L"DownloadProgress", L"UploadProgress", L"ReplyMessage"}));
}

}  // namespace
}  // namespace tarnwick::test
