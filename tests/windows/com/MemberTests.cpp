// Every member of every class, by its slot and by its name: both do the same, and what a host does wrong has
// the error that automation has for it.
#include <gtest/gtest.h>

#include <array>
#include <functional>
#include <map>
#include <string>
#include <vector>

#include "Members.h"

namespace tarnwick::test {
namespace {

// Nobody listens there, and it is a path, a name and an address as good as any.
constexpr wchar_t kText[] = L"127.0.0.1:1";

// An argument as both ways need it, in the storage of a caller.
class Argument {
 public:
  explicit Argument(const Parameter& parameter) : parameter_(parameter) {
    if (Type() != VT_VARIANT) V_VT(&value_) = Type();
    if (!IsResult() && (Type() == VT_BSTR || Type() == VT_VARIANT)) value_ = VariantOf(SysAllocString(kText));
  }
  ~Argument() { VariantClear(&value_); }
  Argument(const Argument&) = delete;
  Argument& operator=(const Argument&) = delete;

  // What the text means as a value of the argument's type.
  void Set(const wchar_t* text) {
    const Bstr owned(text);
    VARIANT source = VariantOf(owned);
    EXPECT_EQ(VariantChangeType(&value_, &source, 0, Type() == VT_VARIANT ? VARTYPE{VT_BSTR} : Type()), S_OK);
  }
  void Set(IDispatch* object) { V_DISPATCH(&value_) = ComPtr<IDispatch>(object).Detach(); }
  bool IsResult() const { return parameter_.Is(PARAMFLAG_FRETVAL); }
  bool IsReference() const { return parameter_.Is(PARAMFLAG_FOUT); }
  bool IsOptional() const { return parameter_.Is(PARAMFLAG_FOPT); }
  VARTYPE Type() const { return parameter_.type; }

  // For a call by the slot.
  VARTYPE SlotType() const { return IsReference() ? kPointer : Type(); }
  VARIANT* SlotValue() {
    V_BYREF(&slot_) = Storage();
    return IsReference() ? &slot_ : &value_;
  }
  // For a call by name. The argument stays the owner.
  VARIANT NameValue() { return IsReference() ? ReferenceTo(Type(), Storage()) : value_; }
  // What is in the storage of a result.
  std::wstring Shown() const { return TextOf(value_); }

 private:
  static constexpr VARTYPE kPointer = sizeof(void*) == 8 ? VT_I8 : VT_I4;
  void* Storage() { return Type() == VT_VARIANT ? static_cast<void*>(&value_) : &V_NONE(&value_); }

  const Parameter& parameter_;
  VARIANT value_ = {};
  VARIANT slot_ = {};
};

// One call of a member with arguments of its own.
class MemberCall {
 public:
  MemberCall(IDispatch& object, const Member& member) : object_(object), member_(member) {
    for (const Parameter& parameter : member.parameters)
      arguments_.push_back(std::make_unique<Argument>(parameter));
    given_ = arguments_.size() - (HasResult() ? 1 : 0);
  }

  bool HasResult() const { return !arguments_.empty() && arguments_.back()->IsResult(); }
  std::size_t Given() const { return given_; }
  const Argument& At(std::size_t index) const { return *arguments_[index]; }
  template <typename Value>
  MemberCall& Giving(Value value) {
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
    return Invoke(values, member_.IsPut() ? &named : nullptr, member_.IsPut() ? 1 : 0);
  }

  // Each argument with its name, the first one first.
  HRESULT ByNamesOfArguments() {
    std::vector<LPOLESTR> names = {const_cast<LPOLESTR>(member_.name.c_str())};
    for (const Parameter& parameter : member_.parameters)
      names.push_back(const_cast<LPOLESTR>(parameter.name.c_str()));
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
    shown_ = SUCCEEDED(called) && HasResult() ? TextOf(result) : L"";
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

struct Subject {
  const char* name;
  ComPtr<IDispatch> (*make)();
};

class Members : public testing::TestWithParam<Subject> {
 protected:
  std::vector<Member> Everything() const {
    ComPtr<ITypeInfo> type;
    EXPECT_EQ(object_->GetTypeInfo(0, 0, type.Receive()), S_OK);
    return MembersOf(*type);
  }

  ComPtr<IDispatch> object_ = GetParam().make();
};

TEST_P(Members, DoTheSameBySlotByNameAndWithNamedArguments) {
  for (const Member& member : Everything()) {
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
  const std::map<VARTYPE, std::pair<const wchar_t*, const wchar_t*>> pairs = {
      {VT_BSTR, {L"one \u00FC", L""}},  {VT_I2, {L"-5", L"300"}},        {VT_I4, {L"70000", L"-1"}},
      {VT_R8, {L"2.5", L"3000000000"}}, {VT_VARIANT, {L"\u00FC", L"2"}}, {VT_BOOL, {L"-1", L"0"}},
  };
  const ComPtr<IDispatch> owners[] = {GetParam().make(), GetParam().make()};
  std::map<DISPID, Member> readers;
  for (const Member& member : Everything()) {
    if (member.kind == INVOKE_PROPERTYGET) readers[member.id] = member;
    if (!member.IsPut()) continue;
    SCOPED_TRACE(std::string(member.name.begin(), member.name.end()));
    if (member.parameters[0].type == VT_DISPATCH) {
      for (const ComPtr<IDispatch>& owner : owners) {
        const ComPtr<IDispatch> given = Object(owner.Get(), member.name.c_str());
        ASSERT_TRUE(given);
        MemberCall put(*object_, member);
        put.Giving(given.Get());
        EXPECT_EQ(&owner == owners ? put.BySlot() : put.ByName(), S_OK);
        EXPECT_EQ(Object(object_.Get(), member.name.c_str()).Get(), given.Get());
      }
      continue;
    }
    const auto& [first, second] = pairs.at(member.parameters[0].type);
    MemberCall read(*object_, readers.at(member.id));
    EXPECT_EQ(MemberCall(*object_, member).Giving(first).BySlot(), S_OK);
    EXPECT_EQ(read.ByName(), S_OK);
    EXPECT_EQ(read.Shown(), first);
    EXPECT_EQ(MemberCall(*object_, member).Giving(second).ByName(), S_OK);
    EXPECT_EQ(read.BySlot(), S_OK);
    EXPECT_EQ(read.Shown(), second);
  }
}

// A null pointer for a result is refused; one for a parameter is refused or stands for nothing.
TEST_P(Members, TakeNullPointersWithoutHarm) {
  for (const Member& member : Everything()) {
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
        const auto null = [&](std::vector<VARIANT>& values) {
          values[last - i] = ReferenceTo(type, nullptr);
        };
        EXPECT_EQ(call.ByName(null), E_POINTER);
        EXPECT_EQ(call.Refused(), last - i);
      }
    }
  }
}

TEST_P(Members, RefuseArgumentsOfOtherTypesAndNumbers) {
  SAFEARRAY* const array = SafeArrayCreateVector(VT_I4, 0, 1);
  VARIANT wrong;
  V_VT(&wrong) = VT_ARRAY | VT_I4;
  V_ARRAY(&wrong) = array;
  for (const Member& member : Everything()) {
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
    testing::Values(Subject{"CFileUpload", [] { return NewObject(CLSID_CFileUpload); }},
                    Subject{"CUpload", [] { return Object(NewClient().Get(), L"UploadObject"); }},
                    Subject{"CBVAccount", [] { return NewObject(CLSID_CBVAccount); }},
                    Subject{"ctrlListImage", [] { return NewObject(CLSID_ctrlListImage); }},
                    Subject{"ctrlThumbNailView", [] { return NewObject(CLSID_ctrlThumbNailView); }}),
    [](const testing::TestParamInfo<Subject>& subject) { return subject.param.name; });

}  // namespace
}  // namespace tarnwick::test
