// Every member of every class, by its slot and by its name: both do the same, and what a host does wrong has
// the error that automation has for it.
#include <gtest/gtest.h>

#include <array>
#include <functional>
#include <map>
#include <string>
#include <vector>

#include "../library/TestLibrary.h"
#include "Host.h"

namespace tarnwick::test {
namespace {

// Nobody listens there, and it is a path, a name and an address as good as any.
constexpr wchar_t kText[] = L"127.0.0.1:1";

// An argument as both ways need it, in the storage of a caller.
class Argument {
 public:
  explicit Argument(VARTYPE type, USHORT flags) : type_(type), flags_(flags) {
    VariantInit(&value_);
    VariantInit(&variant_);
    if ((flags & PARAMFLAG_FRETVAL) != 0) return;
    if (type == VT_BSTR) V_BSTR(&value_) = SysAllocString(kText);
    if (type == VT_VARIANT) variant_ = VariantOf(SysAllocString(kText));
  }
  ~Argument() {
    if (type_ == VT_BSTR) SysFreeString(V_BSTR(&value_));
    if (type_ == VT_DISPATCH && V_DISPATCH(&value_)) V_DISPATCH(&value_)->Release();
    VariantClear(&variant_);
  }
  Argument(const Argument&) = delete;
  Argument& operator=(const Argument&) = delete;

  void Set(VARIANT given) {
    if (type_ == VT_VARIANT) {
      VariantCopy(&variant_, &given);
    } else if (type_ == VT_BSTR) {
      SysReAllocString(&V_BSTR(&value_), V_BSTR(&given));
    } else {
      value_ = given;
      if (type_ == VT_DISPATCH) V_DISPATCH(&value_)->AddRef();
    }
  }
  bool IsResult() const { return (flags_ & PARAMFLAG_FRETVAL) != 0; }
  bool IsReference() const { return (flags_ & PARAMFLAG_FOUT) != 0; }
  bool IsOptional() const { return (flags_ & PARAMFLAG_FOPT) != 0; }
  VARTYPE Type() const { return type_; }

  // For a call by the slot.
  VARTYPE SlotType() const { return IsReference() ? VT_PTR_SIZED : type_; }
  VARIANT* SlotValue() {
    if (!IsReference()) return type_ == VT_VARIANT ? &variant_ : &value_;
    slot_ = value_;
    V_BYREF(&slot_) = Storage();
    return &slot_;
  }
  // For a call by name. The argument stays the owner.
  VARIANT NameValue() {
    VARIANT given;
    if (!IsReference()) {
      given = type_ == VT_VARIANT ? variant_ : value_;
      if (type_ != VT_VARIANT) V_VT(&given) = type_;
      return given;
    }
    V_VT(&given) = static_cast<VARTYPE>(VT_BYREF | type_);
    V_BYREF(&given) = Storage();
    return given;
  }
  // What is in the storage of a result, as text.
  std::wstring Shown() {
    if (type_ == VT_DISPATCH) return V_DISPATCH(&value_) ? L"object" : L"nothing";
    VARIANT held = type_ == VT_VARIANT ? variant_ : value_;
    if (type_ != VT_VARIANT) V_VT(&held) = type_;
    return TextOf(held);
  }
  static std::wstring TextOf(const VARIANT& held) {
    if (V_VT(&held) == VT_DISPATCH) return V_DISPATCH(&held) ? L"object" : L"nothing";
    if ((V_VT(&held) & VT_ARRAY) != 0) return L"array";
    VARIANT text;
    VariantInit(&text);
    VARIANT source = held;
    if (FAILED(VariantChangeType(&text, &source, 0, VT_BSTR))) return L"?";
    std::wstring shown = V_BSTR(&text) ? V_BSTR(&text) : L"";
    VariantClear(&text);
    return shown;
  }

 private:
#ifdef _WIN64
  static constexpr VARTYPE VT_PTR_SIZED = VT_I8;
#else
  static constexpr VARTYPE VT_PTR_SIZED = VT_I4;
#endif
  void* Storage() {
    return type_ == VT_VARIANT ? static_cast<void*>(&variant_) : &V_NONE(&value_);
  }

  VARTYPE type_;
  USHORT flags_;
  VARIANT value_;
  VARIANT variant_;
  VARIANT slot_;
};

struct Member {
  std::wstring name;
  DISPID id = 0;
  INVOKEKIND kind = INVOKE_FUNC;
  short offset = 0;  // of its slot
  std::vector<std::pair<VARTYPE, USHORT>> parameters;
  std::vector<std::wstring> parameterNames;
};

// Interfaces are objects, enumerations are numbers.
VARTYPE TypeOf(ITypeInfo& type, const TYPEDESC& described) {
  if (described.vt == VT_PTR) return VT_DISPATCH;
  if (described.vt != VT_USERDEFINED) return described.vt;
  ComPtr<ITypeInfo> other;
  TYPEATTR* attributes = nullptr;
  type.GetRefTypeInfo(described.hreftype, other.Receive());
  other->GetTypeAttr(&attributes);
  const TYPEKIND kind = attributes->typekind;
  other->ReleaseTypeAttr(attributes);
  return kind == TKIND_ENUM || kind == TKIND_ALIAS ? VARTYPE{VT_I4} : VARTYPE{VT_DISPATCH};
}

std::vector<Member> MembersOf(IDispatch& object) {
  ComPtr<ITypeInfo> shown;
  ComPtr<ITypeInfo> slots;
  HREFTYPE handle = 0;
  EXPECT_EQ(object.GetTypeInfo(0, 0, shown.Receive()), S_OK);
  EXPECT_EQ(shown->GetRefTypeOfImplType(static_cast<UINT>(-1), &handle), S_OK);
  EXPECT_EQ(shown->GetRefTypeInfo(handle, slots.Receive()), S_OK);
  TYPEATTR* attributes = nullptr;
  slots->GetTypeAttr(&attributes);
  const int count = attributes->cFuncs;
  slots->ReleaseTypeAttr(attributes);
  std::vector<Member> members;
  for (int i = 0; i < count; ++i) {
    FUNCDESC* function = nullptr;
    slots->GetFuncDesc(static_cast<UINT>(i), &function);
    BSTR names[10] = {};
    UINT nameCount = 0;
    slots->GetNames(function->memid, names, 10, &nameCount);
    Member member;
    member.name = names[0];
    member.id = function->memid;
    member.kind = function->invkind;
    member.offset = function->oVft;
    for (int k = 0; k < function->cParams; ++k) {
      const ELEMDESC& parameter = function->lprgelemdescParam[k];
      const USHORT flags = parameter.paramdesc.wParamFlags;
      const bool reference = (flags & PARAMFLAG_FOUT) != 0;
      member.parameters.emplace_back(TypeOf(*slots, reference ? *parameter.tdesc.lptdesc : parameter.tdesc),
                                     flags);
      if (static_cast<UINT>(k) + 1 < nameCount) member.parameterNames.emplace_back(names[k + 1]);
    }
    for (const BSTR name : names) SysFreeString(name);
    slots->ReleaseFuncDesc(function);
    members.push_back(std::move(member));
  }
  return members;
}

// One call of a member with arguments of its own.
class MemberCall {
 public:
  MemberCall(IDispatch& object, const Member& member) : object_(object), member_(member) {
    for (const auto& [type, flags] : member.parameters)
      arguments_.push_back(std::make_unique<Argument>(type, flags));
    given_ = arguments_.size() - (HasResult() ? 1 : 0);
  }

  bool HasResult() const { return !arguments_.empty() && arguments_.back()->IsResult(); }
  std::size_t Given() const { return given_; }
  const Argument& At(std::size_t index) const { return *arguments_[index]; }
  MemberCall& Giving(const VARIANT& value) {
    arguments_[0]->Set(value);
    return *this;
  }

  // By the slot; `null` is the index of an argument that is a null pointer.
  HRESULT BySlot(std::size_t null = SIZE_MAX) {
    std::vector<VARTYPE> types;
    std::vector<VARIANTARG*> values;
    for (std::size_t i = 0; i < arguments_.size(); ++i) {
      types.push_back(arguments_[i]->SlotType());
      values.push_back(arguments_[i]->SlotValue());
      if (i == null) V_BYREF(values.back()) = nullptr;
    }
    VARIANT result;
    VariantInit(&result);
    const HRESULT called =
        DispCallFunc(&object_, static_cast<ULONG_PTR>(member_.offset), CC_STDCALL, VT_ERROR,
                     static_cast<UINT>(types.size()), types.data(), values.data(), &result);
    EXPECT_EQ(called, S_OK);
    if (HasResult()) shown_ = null == given_ ? L"" : arguments_.back()->Shown();
    return V_ERROR(&result);
  }

  // By the name; `change` may change the arguments, the last one first.
  HRESULT ByName(const std::function<void(std::vector<VARIANT>&)>& change = {}) {
    std::vector<VARIANT> values;
    for (std::size_t i = given_; i-- > 0;) values.push_back(arguments_[i]->NameValue());
    if (change) change(values);
    DISPID named = DISPID_PROPERTYPUT;
    const bool put = (member_.kind & (INVOKE_PROPERTYPUT | INVOKE_PROPERTYPUTREF)) != 0;
    return Invoke(values, put ? &named : nullptr, put ? 1 : 0);
  }

  // Each argument with its name, the first one first.
  HRESULT ByNamesOfArguments() {
    std::vector<LPOLESTR> names = {const_cast<LPOLESTR>(member_.name.c_str())};
    for (const std::wstring& name : member_.parameterNames)
      names.push_back(const_cast<LPOLESTR>(name.c_str()));
    names.resize(given_ + 1);
    std::vector<DISPID> ids(names.size());
    EXPECT_EQ(object_.GetIDsOfNames(IID_NULL, names.data(), static_cast<UINT>(names.size()), 0, ids.data()),
              S_OK);
    std::vector<VARIANT> values;
    for (std::size_t i = 0; i < given_; ++i) values.push_back(arguments_[i]->NameValue());
    return Invoke(values, ids.data() + 1, static_cast<UINT>(given_));
  }

  // The result of the last call.
  const std::wstring& Shown() const { return shown_; }
  // The argument that the last call by name refused, counted from the last one.
  UINT Refused() const { return refused_; }

 private:
  HRESULT Invoke(std::vector<VARIANT>& values, DISPID* named, UINT namedCount) {
    DISPPARAMS parameters = {values.data(), named, static_cast<UINT>(values.size()), namedCount};
    VARIANT result;
    VariantInit(&result);
    EXCEPINFO exception = {};
    refused_ = 99;
    const HRESULT called =
        object_.Invoke(member_.id, IID_NULL, 0x409, static_cast<WORD>(member_.kind), &parameters,
                       member_.kind == INVOKE_FUNC || member_.kind == INVOKE_PROPERTYGET ? &result : nullptr,
                       &exception, &refused_);
    SysFreeString(exception.bstrSource);
    SysFreeString(exception.bstrDescription);
    SysFreeString(exception.bstrHelpFile);
    shown_ = SUCCEEDED(called) && HasResult() ? Argument::TextOf(result) : L"";
    VariantClear(&result);
    return called == DISP_E_EXCEPTION ? exception.scode : called;
  }

  IDispatch& object_;
  const Member& member_;
  std::vector<std::unique_ptr<Argument>> arguments_;
  std::size_t given_ = 0;
  std::wstring shown_;
  UINT refused_ = 0;
};

ComPtr<IDispatch> NewObject(REFCLSID classId) {
  ComPtr<IDispatch> object;
  CoCreateInstance(classId, nullptr, CLSCTX_INPROC_SERVER, IID_IDispatch, object.ReceiveVoid());
  return object;
}

ComPtr<IDispatch> NewRecord() {
  const ComPtr<_CFileUpload> client = NewClient();
  ComPtr<_CUpload> record;
  if (client) client->get_UploadObject(record.Receive());
  return ComPtr<IDispatch>(record.Get());
}

struct Subject {
  const char* name;
  ComPtr<IDispatch> (*make)(const TestLibrary& library);
};

class Members : public testing::TestWithParam<Subject> {
 protected:
  TestLibrary library_;
  ComPtr<IDispatch> object_ = GetParam().make(library_);
};

TEST_P(Members, DoTheSameBySlotByNameAndWithNamedArguments) {
  ASSERT_TRUE(object_);
  for (const Member& member : MembersOf(*object_)) {
    SCOPED_TRACE(std::string(member.name.begin(), member.name.end()));
    MemberCall slot(*object_, member);
    const HRESULT answer = slot.BySlot();
    MemberCall name(*object_, member);
    EXPECT_EQ(name.ByName(), answer);
    // A call that failed has no result by name.
    const std::wstring shown = SUCCEEDED(answer) ? slot.Shown() : L"";
    EXPECT_EQ(name.Shown(), shown);
    if (member.kind != INVOKE_FUNC) continue;
    MemberCall named(*object_, member);
    EXPECT_EQ(named.ByNamesOfArguments(), answer);
    EXPECT_EQ(named.Shown(), shown);
  }
}

// Written on one way, a property is read on the other. A truth is left as false: one ends the next transfer.
TEST_P(Members, KeepWhatTheyAreGivenOnBothWays) {
  ASSERT_TRUE(object_);
  const Bstr text(L"one \u00FC");
  const Bstr empty;
  const auto of = [](VARTYPE type, auto set) {
    VARIANT value = {};
    V_VT(&value) = type;
    set(value);
    return value;
  };
  const auto number = [&](short value) { return of(VT_I2, [=](VARIANT& held) { V_I2(&held) = value; }); };
  const auto real = [&](double value) { return of(VT_R8, [=](VARIANT& held) { V_R8(&held) = value; }); };
  const auto truth = [&](VARIANT_BOOL value) {
    return of(VT_BOOL, [=](VARIANT& held) { V_BOOL(&held) = value; });
  };
  const std::map<VARTYPE, std::pair<VARIANT, VARIANT>> pairs = {
      {VT_BSTR, {VariantOf(text), VariantOf(empty)}}, {VT_I2, {number(-5), number(300)}},
      {VT_I4, {VariantOf(70'000L), VariantOf(-1L)}},  {VT_R8, {real(2.5), real(3e9)}},
      {VT_VARIANT, {VariantOf(text), real(12.5)}},    {VT_BOOL, {truth(VARIANT_TRUE), truth(VARIANT_FALSE)}},
  };
  const ComPtr<IDispatch> owners[] = {GetParam().make(library_), GetParam().make(library_)};
  std::map<DISPID, Member> readers;
  for (const Member& member : MembersOf(*object_)) {
    if (member.kind == INVOKE_PROPERTYGET) readers[member.id] = member;
    if ((member.kind & (INVOKE_PROPERTYPUT | INVOKE_PROPERTYPUTREF)) == 0) continue;
    SCOPED_TRACE(std::string(member.name.begin(), member.name.end()));
    const VARTYPE type = member.parameters[0].first;
    if (type == VT_DISPATCH) {
      for (const ComPtr<IDispatch>& owner : owners) {
        VARIANT given = Get(owner.Get(), member.name.c_str());
        ASSERT_EQ(V_VT(&given), VT_DISPATCH);
        MemberCall put(*object_, member);
        EXPECT_EQ(&owner == owners ? put.Giving(given).BySlot() : put.Giving(given).ByName(), S_OK);
        VARIANT read = Get(object_.Get(), member.name.c_str());
        EXPECT_EQ(V_DISPATCH(&read), V_DISPATCH(&given));
        VariantClear(&read);
        VariantClear(&given);
      }
      continue;
    }
    const auto& [first, second] = pairs.at(type);
    MemberCall read(*object_, readers.at(member.id));
    EXPECT_EQ(MemberCall(*object_, member).Giving(first).BySlot(), S_OK);
    EXPECT_EQ(read.ByName(), S_OK);
    EXPECT_EQ(read.Shown(), Argument::TextOf(first));
    EXPECT_EQ(MemberCall(*object_, member).Giving(second).ByName(), S_OK);
    EXPECT_EQ(read.BySlot(), S_OK);
    EXPECT_EQ(read.Shown(), Argument::TextOf(second));
  }
}

// A null pointer for a result is refused; one for a parameter is refused or stands for nothing.
TEST_P(Members, TakeNullPointersWithoutHarm) {
  ASSERT_TRUE(object_);
  for (const Member& member : MembersOf(*object_)) {
    SCOPED_TRACE(std::string(member.name.begin(), member.name.end()));
    const HRESULT usual = MemberCall(*object_, member).BySlot();
    for (std::size_t i = 0; i < member.parameters.size(); ++i) {
      MemberCall call(*object_, member);
      if (!call.At(i).IsReference()) continue;
      const HRESULT answer = call.BySlot(i);
      EXPECT_TRUE(answer == E_POINTER || (!call.At(i).IsResult() && answer == usual)) << i << ": " << answer;
      if (call.At(i).IsResult()) continue;
      const std::size_t last = call.Given() - 1;
      for (const VARTYPE type : {call.At(i).Type(), VARTYPE{VT_VARIANT}}) {
        EXPECT_EQ(call.ByName([&](std::vector<VARIANT>& values) {
          V_VT(&values[last - i]) = static_cast<VARTYPE>(VT_BYREF | type);
          V_BYREF(&values[last - i]) = nullptr;
        }),
                  E_POINTER);
        EXPECT_EQ(call.Refused(), last - i);
      }
    }
  }
}

TEST_P(Members, RefuseArgumentsOfOtherTypesAndNumbers) {
  ASSERT_TRUE(object_);
  SAFEARRAY* const array = SafeArrayCreateVector(VT_I4, 0, 1);
  VARIANT wrong;
  V_VT(&wrong) = VT_ARRAY | VT_I4;
  V_ARRAY(&wrong) = array;
  for (const Member& member : MembersOf(*object_)) {
    SCOPED_TRACE(std::string(member.name.begin(), member.name.end()));
    MemberCall call(*object_, member);
    for (std::size_t i = 0; i < call.Given(); ++i) {
      if (call.At(i).Type() == VT_VARIANT) continue;
      EXPECT_EQ(call.ByName([&](std::vector<VARIANT>& values) { values[call.Given() - 1 - i] = wrong; }),
                DISP_E_TYPEMISMATCH)
          << "argument " << i;
      // Of the other ones not every version of the system tells.
      EXPECT_TRUE(!call.At(i).IsReference() || call.Refused() == call.Given() - 1 - i) << "argument " << i;
    }
    if (member.kind != INVOKE_FUNC) continue;
    EXPECT_EQ(call.ByName([&](std::vector<VARIANT>& values) { values.push_back(wrong); }),
              DISP_E_BADPARAMCOUNT);
    if (call.Given() == 0) continue;
    // The last one is left out, or said to be.
    const HRESULT fewer = call.ByName([](std::vector<VARIANT>& values) { values.erase(values.begin()); });
    const HRESULT omitted = call.ByName([](std::vector<VARIANT>& values) {
      V_VT(&values[0]) = VT_ERROR;
      V_ERROR(&values[0]) = DISP_E_PARAMNOTFOUND;
    });
    const Argument& last = call.At(call.Given() - 1);
    EXPECT_EQ(fewer, last.IsOptional() ? S_OK : DISP_E_BADPARAMCOUNT);
    // A VARIANT can hold that nothing was given.
    const HRESULT expected = last.IsOptional() ? S_OK : DISP_E_PARAMNOTOPTIONAL;
    EXPECT_TRUE(last.Type() == VT_VARIANT || omitted == expected) << omitted;
  }
  SafeArrayDestroy(array);
}

INSTANTIATE_TEST_SUITE_P(
    Of, Members,
    testing::Values(
        Subject{"CFileUpload", [](const TestLibrary&) { return NewObject(CLSID_CFileUpload); }},
        Subject{"CUpload", [](const TestLibrary&) { return NewRecord(); }},
        Subject{"CBVAccount", [](const TestLibrary&) { return NewObject(CLSID_CBVAccount); }},
        Subject{"CRegistry",
                [](const TestLibrary& library) {
                  ComPtr<IDispatch> registry;
                  library.Get<MakeRegistry>("MakeRegistry")(registry.Receive());
                  return registry;
                }},
        Subject{"ctrlListImage", [](const TestLibrary&) { return NewObject(CLSID_ctrlListImage); }},
        Subject{"ctrlThumbNailView", [](const TestLibrary&) { return NewObject(CLSID_ctrlThumbNailView); }}),
    [](const testing::TestParamInfo<Subject>& subject) { return subject.param.name; });

}  // namespace
}  // namespace tarnwick::test
