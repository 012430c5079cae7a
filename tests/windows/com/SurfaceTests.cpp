// The type library inside the built library, as a host's compiler reads it, beside what hosts were promised:
// compiled hosts hold identifiers, numbers and types, and docs/reference.md tells the names.
#include <gtest/gtest.h>

#include <algorithm>
#include <fstream>
#include <iterator>
#include <regex>
#include <sstream>

#include "Members.h"

namespace tarnwick::test {
namespace {

std::string Narrow(const std::wstring& text) {
  return {text.begin(), text.end()};  // names are ASCII
}

std::string GuidText(const GUID& guid) {
  wchar_t text[39];
  StringFromGUID2(guid, text, 39);
  return Narrow(text);
}

// What a type says of itself.
struct Type {
  explicit Type(ComPtr<ITypeInfo> itsInfo) : info(std::move(itsInfo)), name(Narrow(NameOf(*info))) {
    TYPEATTR* lent = nullptr;
    info->GetTypeAttr(&lent);
    attributes = *lent;
    info->ReleaseTypeAttr(lent);
  }
  ComPtr<ITypeInfo> info;
  std::string name;
  TYPEATTR attributes = {};
};

class Surface : public testing::Test {
 protected:
  void SetUp() override {
    // The registration names the built file.
    wchar_t path[MAX_PATH] = {};
    DWORD size = sizeof path;
    RegGetValueW(HKEY_CLASSES_ROOT, L"CLSID\\{8114E25E-B445-4D77-866F-FDA3EA5D6812}\\InprocServer32", nullptr,
                 RRF_RT_REG_SZ, nullptr, path, &size);
    ASSERT_EQ(LoadTypeLibEx(path, REGKIND_NONE, library.Receive()), S_OK);
    for (UINT i = 0; i < library->GetTypeInfoCount(); ++i) {
      ComPtr<ITypeInfo> info;
      ASSERT_EQ(library->GetTypeInfo(i, info.Receive()), S_OK);
      types.emplace_back(std::move(info));
    }
    std::ifstream file("docs/reference.md", std::ios::binary);
    reference.assign(std::istreambuf_iterator<char>(file), {});
  }
  // From the heading of the second level that names it to the next.
  std::string SectionOf(const std::string& name) const {
    for (std::size_t begin = 0; (begin = reference.find("\n## ", begin)) != std::string::npos;) {
      const std::size_t end = reference.find("\n## ", begin + 1);
      std::string section = reference.substr(begin, end - begin);
      if (section.substr(0, section.find('\n', 1)).find(" " + name) != std::string::npos) return section;
      begin = end;
    }
    return "";
  }

  ComPtr<ITypeLib> library;
  std::vector<Type> types;
  std::string reference;
};

// All that hosts were compiled with of a class or an interface, in words.
std::string DeclarationOf(const Type& type) {
  std::ostringstream text;
  text << type.attributes.wTypeFlags << "\n";
  for (UINT i = 0; type.attributes.typekind == TKIND_COCLASS && i < type.attributes.cImplTypes; ++i) {
    INT flags = 0;
    HREFTYPE handle = 0;
    ComPtr<ITypeInfo> other;
    type.info->GetImplTypeFlags(i, &flags);
    type.info->GetRefTypeOfImplType(i, &handle);
    type.info->GetRefTypeInfo(handle, other.Receive());
    text << Narrow(NameOf(*other)) << " " << flags << "\n";
  }
  if (type.attributes.typekind != TKIND_DISPATCH) return text.str();
  for (const Member& member : MembersOf(*type.info)) {
    text << member.id << " " << member.kind << " " << Narrow(member.name);
    for (const Parameter& parameter : member.parameters)
      text << ", " << parameter.type << " " << Narrow(parameter.declared) << " " << parameter.flags << " "
           << Narrow(parameter.name);
    text << "\n";
  }
  return text.str();
}

std::uint32_t ChecksumOf(const std::string& text) {
  std::uint32_t sum = 2166136261U;
  for (const char byte : text) sum = (sum ^ static_cast<unsigned char>(byte)) * 16777619U;
  return sum;
}

// None of this ever changes: an interface that hosts were compiled with stays as it is.
TEST_F(Surface, IsWhatHostsWereCompiledWith) {
  const struct {
    const char* name;
    const char* id;
    std::uint32_t declaration;
  } promises[] = {
      {"CFileUpload", "{8114E25E-B445-4D77-866F-FDA3EA5D6812}", 0x5AA77B93},
      {"CUpload", "{8D9338FE-F656-4D71-9336-6B09E0E67523}", 0x58D95F8B},
      {"CBVAccount", "{1B6D0A96-5E5D-4AA2-8BA7-4B5E17F1E2FB}", 0xA3C5A0D9},
      {"CRegistry", "{3A8449AE-8DA1-4935-BD12-30B65E4FA234}", 0x35880175},
      {"ctrlListImage", "{DFAFD94C-0F50-4AC7-A38D-E36205B4B1F3}", 0xD592B511},
      {"ctrlThumbNailView", "{53D96008-537F-4F77-B41E-B3B7B217A1E2}", 0x73445DA5},
      {"_CUpload", "{16BC4A50-C22D-4B00-9814-C94C5E25FE02}", 0x23D07FBF},
      {"_CBVAccount", "{F97AA79D-F6C7-4FEE-A732-3A4E42F4E181}", 0xAB784E8D},
      {"_CRegistry", "{CE55C7AA-2153-4A53-B0F5-04A068C8A9AD}", 0xF0C5FC3A},
      {"_CFileUpload", "{890C965C-C9AF-43E7-B1C8-377064CBDD62}", 0x732E221E},
      {"_ctrlListImage", "{F1D5E6FB-29DC-4165-9E6E-7A2418F558FD}", 0x3C4E3971},
      {"_ctrlThumbNailView", "{8E223A50-97D3-4259-AA1A-FCC2A472C808}", 0xF57AC25F},
      {"__ctrlListImage", "{4DD02738-7127-4DA9-9657-47AB47B51BA2}", 0xBD142AE6},
      {"__ctrlThumbNailView", "{91CB9DCC-98F4-43C9-847C-A1D1C02B8323}", 0xBD142AE6},
  };
  for (const auto& promise : promises) {
    const auto type =
        std::ranges::find_if(types, [&](const Type& each) { return each.name == promise.name; });
    ASSERT_NE(type, types.end()) << promise.name;
    EXPECT_EQ(GuidText(type->attributes.guid), promise.id) << promise.name;
    const std::string declaration = DeclarationOf(*type);
    EXPECT_EQ(ChecksumOf(declaration), promise.declaration) << promise.name << " " << declaration;
  }
  TLIBATTR* attributes = nullptr;
  ASSERT_EQ(library->GetLibAttr(&attributes), S_OK);
  EXPECT_EQ(attributes->wMajorVerNum, 1);
  EXPECT_EQ(attributes->wMinorVerNum, 1);
  EXPECT_EQ(attributes->lcid, 0x409U);
  EXPECT_EQ(attributes->syskind, sizeof(void*) == 8 ? SYS_WIN64 : SYS_WIN32);
  EXPECT_EQ(GuidText(attributes->guid), "{754704D0-90F5-4500-99D4-9C568F21FE56}");
  library->ReleaseTLibAttr(attributes);
}

// Every member and event stands there with its parameters, and every enumeration with its values: a heading
// of the third level, and below it each name.
TEST_F(Surface, IsWhatTheReferenceTells) {
  std::ostringstream values;
  for (const Type& type : types) {
    const bool isOfEvents = type.name.starts_with("__");
    const std::string section = SectionOf(type.name.substr(type.name.find_first_not_of('_')));
    if (type.attributes.typekind == TKIND_DISPATCH) {
      for (const Member& member : MembersOf(*type.info)) {
        EXPECT_NE(member.help, L"") << type.name << "." << Narrow(member.name);
        std::string entry;
        for (const Parameter& parameter : member.parameters) {
          if (parameter.Is(PARAMFLAG_FRETVAL)) continue;
          const bool isOptional = parameter.Is(PARAMFLAG_FOPT);
          if (!entry.empty()) entry += ", ";
          entry += isOptional ? "[" : "";
          entry += parameter.Is(PARAMFLAG_FOUT) && !isOfEvents ? "ref " : "";
          entry += Narrow(parameter.name);
          entry += isOptional ? "]" : "";
        }
        entry = "`" + Narrow(member.name) + (member.kind == INVOKE_FUNC ? "(" + entry + ")" : "") + "`";
        EXPECT_NE(section.find(entry), std::string::npos) << entry << " of " << type.name;
      }
    }
    if (type.attributes.typekind != TKIND_ENUM) continue;
    values << type.name << "\n";
    VARDESC* variable = nullptr;
    for (UINT i = 0; SUCCEEDED(type.info->GetVarDesc(i, &variable)); ++i) {
      Bstr name;
      type.info->GetDocumentation(variable->memid, name.Receive(), nullptr, nullptr, nullptr);
      values << Narrow(name.Text()) << " = " << V_I4(variable->lpvarValue) << "\n";
      type.info->ReleaseVarDesc(variable);
    }
  }
  const std::string section = SectionOf("Enumerations");
  const std::regex entry(R"(### `(\w+)`|`(\w+)` (-?\d+)(?=[,\n]))");
  std::string told;
  for (std::sregex_iterator at(section.begin(), section.end(), entry), end; at != end; ++at)
    told += (*at)[1].matched ? (*at)[1].str() + "\n" : (*at)[2].str() + " = " + (*at)[3].str() + "\n";
  EXPECT_EQ(values.str(), told);
}

}  // namespace
}  // namespace tarnwick::test
