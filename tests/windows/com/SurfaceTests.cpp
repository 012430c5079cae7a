// The type library inside the built library, read back as a host's compiler reads it, beside the surface that
// hosts were promised.
#include "SurfaceTable.h"

#include <gtest/gtest.h>

#include <fstream>
#include <iterator>
#include <map>
#include <regex>
#include <set>
#include <sstream>
#include <vector>

#include "Host.h"

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

ComPtr<ITypeLib> TheLibrary() {
  // The registration names the built file.
  wchar_t path[MAX_PATH] = {};
  DWORD size = sizeof path;
  const std::wstring key = L"CLSID\\{8114E25E-B445-4D77-866F-FDA3EA5D6812}\\InprocServer32";
  ComPtr<ITypeLib> library;
  if (RegGetValueW(HKEY_CLASSES_ROOT, key.c_str(), nullptr, RRF_RT_REG_SZ, nullptr, path, &size) ==
      ERROR_SUCCESS)
    LoadTypeLibEx(path, REGKIND_NONE, library.Receive());
  return library;
}

struct Named {
  std::string name;
  std::string help;
};

// Of a member, or with MEMBERID_NIL of the type itself.
Named NamesOf(ITypeInfo& type, MEMBERID member) {
  Bstr name;
  Bstr help;
  type.GetDocumentation(member, name.Receive(), help.Receive(), nullptr, nullptr);
  return {Narrow(name.Text()), Narrow(help.Text())};
}

// A description that the type library lends.
template <typename Description, void (STDMETHODCALLTYPE ITypeInfo::*release)(Description*)>
class Lent {
 public:
  explicit Lent(ITypeInfo& type) : type_(type) {}
  ~Lent() {
    if (description_) (type_.*release)(description_);
  }
  Lent(const Lent&) = delete;
  Lent& operator=(const Lent&) = delete;
  Description** Receive() { return &description_; }
  const Description* operator->() const { return description_; }

 private:
  ITypeInfo& type_;
  Description* description_ = nullptr;
};
using Attributes = Lent<TYPEATTR, &ITypeInfo::ReleaseTypeAttr>;
using Function = Lent<FUNCDESC, &ITypeInfo::ReleaseFuncDesc>;
using Variable = Lent<VARDESC, &ITypeInfo::ReleaseVarDesc>;

// Compiled hosts hold these numbers, which never change.
const std::map<std::string, std::string> kIdentifiers = {
    {"CFileUpload", "{8114E25E-B445-4D77-866F-FDA3EA5D6812}"},
    {"CUpload", "{8D9338FE-F656-4D71-9336-6B09E0E67523}"},
    {"CBVAccount", "{1B6D0A96-5E5D-4AA2-8BA7-4B5E17F1E2FB}"},
    {"CRegistry", "{3A8449AE-8DA1-4935-BD12-30B65E4FA234}"},
    {"ctrlListImage", "{DFAFD94C-0F50-4AC7-A38D-E36205B4B1F3}"},
    {"ctrlThumbNailView", "{53D96008-537F-4F77-B41E-B3B7B217A1E2}"},
    {"_CUpload", "{16BC4A50-C22D-4B00-9814-C94C5E25FE02}"},
    {"_CBVAccount", "{F97AA79D-F6C7-4FEE-A732-3A4E42F4E181}"},
    {"_CRegistry", "{CE55C7AA-2153-4A53-B0F5-04A068C8A9AD}"},
    {"_CFileUpload", "{890C965C-C9AF-43E7-B1C8-377064CBDD62}"},
    {"_ctrlListImage", "{F1D5E6FB-29DC-4165-9E6E-7A2418F558FD}"},
    {"_ctrlThumbNailView", "{8E223A50-97D3-4259-AA1A-FCC2A472C808}"},
    {"__ctrlListImage", "{4DD02738-7127-4DA9-9657-47AB47B51BA2}"},
    {"__ctrlThumbNailView", "{91CB9DCC-98F4-43C9-847C-A1D1C02B8323}"},
};

// What a type says of itself; each has a help string.
struct Described {
  explicit Described(ITypeInfo& type) : names(NamesOf(type, MEMBERID_NIL)), attributes(type) {
    type.GetTypeAttr(attributes.Receive());
    EXPECT_NE(names.help, "") << names.name;
    if (const auto known = kIdentifiers.find(names.name); known != kIdentifiers.end()) {
      EXPECT_EQ(GuidText(attributes->guid), known->second) << names.name;
    }
  }
  const Named names;
  Attributes attributes;
};

// The words of the table for a type; pointers to interfaces are objects of that interface.
std::string WordOf(ITypeInfo& type, const TYPEDESC& described) {
  switch (described.vt) {
    case VT_BSTR:
      return "text";
    case VT_I2:
      return "short";
    case VT_I4:
      return "long";
    case VT_R4:
      return "single";
    case VT_R8:
      return "double";
    case VT_BOOL:
      return "boolean";
    case VT_VARIANT:
      return "variant";
    case VT_DISPATCH:
      return "object";
    case VT_PTR:
      // To an interface; what is by reference has been taken off before.
      return described.lptdesc->vt == VT_USERDEFINED ? WordOf(type, *described.lptdesc) : "pointer";
    case VT_USERDEFINED: {
      ComPtr<ITypeInfo> other;
      if (FAILED(type.GetRefTypeInfo(described.hreftype, other.Receive()))) return "unknown";
      const std::string name = NamesOf(*other, MEMBERID_NIL).name;
      if (name == "IDispatch") return "object";
      if (name == "IPictureDisp" || name == "Picture") return "picture";
      return name.starts_with('_') ? name.substr(1) : name;
    }
    default:
      return "vt" + std::to_string(described.vt);
  }
}

std::string DefaultOf(const PARAMDESC& described) {
  if ((described.wParamFlags & PARAMFLAG_FHASDEFAULT) == 0) return "";
  VARIANT& value = described.pparamdescex->varDefaultValue;
  if (V_VT(&value) == VT_BSTR)
    return " = \"" + Narrow(std::wstring(V_BSTR(&value) ? V_BSTR(&value) : L"")) + "\"";
  VARIANT number;
  VariantInit(&number);
  return SUCCEEDED(VariantChangeType(&number, &value, 0, VT_I4)) ? " = " + std::to_string(V_I4(&number))
                                                                 : " = ?";
}

// "name(parameters): result"
std::string SignatureOf(ITypeInfo& type, const FUNCDESC& function) {
  BSTR names[20] = {};
  UINT count = 0;
  type.GetNames(function.memid, names, 20, &count);
  std::ostringstream text;
  std::string result;
  text << Narrow(names[0]) << "(";
  for (int i = 0; i < function.cParams; ++i) {
    const ELEMDESC& parameter = function.lprgelemdescParam[i];
    const USHORT flags = parameter.paramdesc.wParamFlags;
    if ((flags & PARAMFLAG_FRETVAL) != 0) {
      result = ": " + WordOf(type, *parameter.tdesc.lptdesc);
      continue;
    }
    const bool reference = (flags & PARAMFLAG_FOUT) != 0;
    text << (i > 0 ? ", " : "") << ((flags & PARAMFLAG_FOPT) != 0 ? "optional " : "")
         << ((flags & PARAMFLAG_FIN) != 0 ? "" : "only ") << (reference ? "ref " : "")
         << (static_cast<UINT>(i) + 1 < count ? Narrow(names[i + 1]) : "?") << ": "
         << WordOf(type, reference ? *parameter.tdesc.lptdesc : parameter.tdesc)
         << DefaultOf(parameter.paramdesc);
  }
  text << ")" << result;
  for (const BSTR name : names) SysFreeString(name);
  return text.str();
}

// Numbers that no member of the thumbnails has.
const std::set<MEMBERID> kNoThumbNailMembers = {9, 20, 27, 33, 39};

// The members in the order of the interface; a property that can be read and set is one line.
std::string InterfaceLines(ITypeInfo& shown) {
  std::ostringstream lines;
  const Described described(shown);
  const Named& names = described.names;
  const Attributes& attributes = described.attributes;
  EXPECT_NE(attributes->wTypeFlags & TYPEFLAG_FHIDDEN, 0) << names.name;
  lines << "interface " << names.name << "\n";

  // The side with a slot for each member, which early-bound hosts call.
  HREFTYPE handle = 0;
  ComPtr<ITypeInfo> type;
  if (FAILED(shown.GetRefTypeOfImplType(static_cast<UINT>(-1), &handle)) ||
      FAILED(shown.GetRefTypeInfo(handle, type.Receive())))
    return lines.str() + "not dual\n";
  Attributes slots(*type);
  type->GetTypeAttr(slots.Receive());
  EXPECT_EQ(slots->wTypeFlags,
            TYPEFLAG_FHIDDEN | TYPEFLAG_FDUAL | TYPEFLAG_FOLEAUTOMATION | TYPEFLAG_FDISPATCHABLE)
      << names.name;
  std::map<MEMBERID, std::string> readable;
  std::map<MEMBERID, int> settable;
  MEMBERID last = 0;
  for (UINT i = 0; i < slots->cFuncs; ++i) {
    Function function(*type);
    type->GetFuncDesc(i, function.Receive());
    const Named member = NamesOf(*type, function->memid);
    EXPECT_NE(member.help, "") << names.name << "." << member.name;
    EXPECT_EQ(function->elemdescFunc.tdesc.vt, VT_HRESULT) << names.name << "." << member.name;
    // Compiled hosts hold these numbers.
    if ((function->invkind & (INVOKE_FUNC | INVOKE_PROPERTYGET)) != 0) {
      do ++last;
      while (names.name == "_ctrlThumbNailView" && kNoThumbNailMembers.contains(last));
      EXPECT_EQ(function->memid, last) << names.name << "." << member.name;
    }
    if (function->invkind == INVOKE_FUNC) {
      lines << SignatureOf(*type, *function.operator->()) << "\n";
    } else if (function->invkind == INVOKE_PROPERTYGET) {
      const std::string word = WordOf(*type, *function->lprgelemdescParam[0].tdesc.lptdesc);
      readable[function->memid] = word;
      lines << member.name << ": " << word << "\n";
    } else {
      EXPECT_EQ(readable[function->memid], WordOf(*type, function->lprgelemdescParam[0].tdesc))
          << names.name << "." << member.name;
      settable[function->memid] |= function->invkind;
    }
  }
  for (const auto& [id, word] : readable) {
    const bool object = word == "object" || word == "CUpload" || word == "CFileUpload";
    EXPECT_EQ(settable[id], INVOKE_PROPERTYPUT | (object ? INVOKE_PROPERTYPUTREF : 0))
        << names.name << " " << id;
  }
  return lines.str();
}

std::string EventLines(ITypeInfo& type) {
  std::ostringstream lines;
  const Described described(type);
  const Named& names = described.names;
  const Attributes& attributes = described.attributes;
  EXPECT_NE(attributes->wTypeFlags & TYPEFLAG_FHIDDEN, 0) << names.name;
  lines << "events " << names.name << "\n";
  for (UINT i = 0; i < attributes->cFuncs; ++i) {
    Function function(type);
    type.GetFuncDesc(i, function.Receive());
    // Those of IUnknown and IDispatch come first.
    if ((function->wFuncFlags & FUNCFLAG_FRESTRICTED) != 0) continue;
    EXPECT_NE(NamesOf(type, function->memid).help, "") << names.name << " " << function->memid;
    EXPECT_EQ(function->elemdescFunc.tdesc.vt, VT_VOID) << names.name << " " << function->memid;
    lines << function->memid << " " << SignatureOf(type, *function.operator->()) << "\n";
  }
  return lines.str();
}

std::string EnumerationLines(ITypeInfo& type) {
  std::ostringstream lines;
  const Described described(type);
  const Named& names = described.names;
  const Attributes& attributes = described.attributes;
  lines << "enumeration " << names.name << "\n";
  for (UINT i = 0; i < attributes->cVars; ++i) {
    Variable variable(type);
    type.GetVarDesc(i, variable.Receive());
    const VARIANT& value = *variable->lpvarValue;
    EXPECT_EQ(V_VT(&value), VT_I4) << names.name;
    lines << NamesOf(type, variable->memid).name << " = " << V_I4(&value) << "\n";
  }
  return lines.str();
}

// "class NAME [creatable] [control] default INTERFACE [events INTERFACE]"
std::string ClassLine(ITypeInfo& type) {
  std::ostringstream line;
  const Described described(type);
  const Named& names = described.names;
  const Attributes& attributes = described.attributes;
  line << "class " << names.name << ((attributes->wTypeFlags & TYPEFLAG_FCANCREATE) != 0 ? " creatable" : "")
       << ((attributes->wTypeFlags & TYPEFLAG_FCONTROL) != 0 ? " control" : "");
  for (UINT i = 0; i < attributes->cImplTypes; ++i) {
    INT flags = 0;
    HREFTYPE handle = 0;
    ComPtr<ITypeInfo> other;
    type.GetImplTypeFlags(i, &flags);
    type.GetRefTypeOfImplType(i, &handle);
    type.GetRefTypeInfo(handle, other.Receive());
    EXPECT_NE(flags & IMPLTYPEFLAG_FDEFAULT, 0) << names.name;
    line << ((flags & IMPLTYPEFLAG_FSOURCE) != 0 ? " events " : " default ")
         << NamesOf(*other, MEMBERID_NIL).name;
  }
  line << "\n";
  return line.str();
}

// The parts of the table, by their headings, which are their first lines.
std::map<std::string, std::string> PartsOf(const std::string& table) {
  std::map<std::string, std::string> parts;
  std::vector<std::string> headings;
  std::istringstream lines(table);
  for (std::string line; std::getline(lines, line);) {
    if (line.empty()) continue;
    const std::string word = line.substr(0, line.find(' ') + 1);
    if (word == "class " || word == "interface " || word == "events " || word == "enumeration ") {
      const std::size_t comma = line.find(", ");
      headings = {line.substr(0, comma)};
      if (comma != std::string::npos) headings.push_back(word + line.substr(comma + 2));
      for (const std::string& heading : headings) parts[heading] = heading + "\n";
      continue;
    }
    const bool isOfOne = word == "(list) " || word == "(thumbnails) ";
    if (isOfOne) line.erase(0, word.size());
    for (std::size_t i = 0; i < headings.size(); ++i)
      if (!isOfOne || (i == 0) == (word == "(list) ")) parts[headings[i]] += line + "\n";
  }
  return parts;
}

// The reference of the current folder.
std::string Reference() {
  std::ifstream file("docs/reference.md", std::ios::binary);
  return {std::istreambuf_iterator<char>(file), {}};
}

// From the heading of the second level that names it to the next.
std::string SectionOf(const std::string& document, const std::string& name) {
  for (std::size_t begin = 0; (begin = document.find("\n## ", begin)) != std::string::npos;) {
    const std::size_t end = document.find("\n## ", begin + 1);
    const std::string section = document.substr(begin, end - begin);
    if (section.substr(0, section.find('\n', 1)).find(" " + name) != std::string::npos) return section;
    begin = end;
  }
  return "";
}

// As the type library has them: a heading of the third level for each, and below it each name with its value.
std::string EnumerationsOfTheReference() {
  const std::string section = SectionOf(Reference(), "Enumerations");
  const std::regex entry(R"(### `(\w+)`|`(\w+)` (-?\d+)(?=[,\n]))");
  std::string lines;
  for (std::sregex_iterator at(section.begin(), section.end(), entry), end; at != end; ++at)
    lines += (*at)[1].matched ? "enumeration " + (*at)[1].str() + "\n"
                              : (*at)[2].str() + " = " + (*at)[3].str() + "\n";
  return lines;
}

TEST(Surface, IsWhatHostsWerePromised) {
  const ComPtr<ITypeLib> library = TheLibrary();
  ASSERT_TRUE(library);
  TLIBATTR* attributes = nullptr;
  ASSERT_EQ(library->GetLibAttr(&attributes), S_OK);
  Bstr name;
  Bstr help;
  library->GetDocumentation(-1, name.Receive(), help.Receive(), nullptr, nullptr);
  EXPECT_EQ(name.Text(), L"Tarnwick");
  EXPECT_EQ(help.Text(), L"Tarnwick");
  EXPECT_EQ(attributes->wMajorVerNum, 1);
  EXPECT_EQ(attributes->wMinorVerNum, 1);
  EXPECT_EQ(attributes->lcid, 0x409U);
  EXPECT_EQ(attributes->syskind, sizeof(void*) == 8 ? SYS_WIN64 : SYS_WIN32);
  EXPECT_EQ(GuidText(attributes->guid), "{754704D0-90F5-4500-99D4-9C568F21FE56}");
  library->ReleaseTLibAttr(attributes);

  std::string built;
  for (UINT i = 0; i < library->GetTypeInfoCount(); ++i) {
    ComPtr<ITypeInfo> type;
    TYPEKIND kind = TKIND_MAX;
    ASSERT_EQ(library->GetTypeInfo(i, type.Receive()), S_OK);
    library->GetTypeInfoType(i, &kind);
    if (kind == TKIND_COCLASS) {
      built += ClassLine(*type);
    } else if (kind == TKIND_ENUM) {
      built += EnumerationLines(*type);
    } else if (kind == TKIND_DISPATCH) {
      const std::string itsName = NamesOf(*type, MEMBERID_NIL).name;
      built += itsName.starts_with("__") ? EventLines(*type) : InterfaceLines(*type);
    } else {
      // An alias that the compiler made of an enumeration's name is no declaration of its own.
      EXPECT_EQ(kind, TKIND_ALIAS) << NamesOf(*type, MEMBERID_NIL).name;
    }
  }
  const auto promised = PartsOf(kSurface + EnumerationsOfTheReference());
  const auto found = PartsOf(built);
  for (const auto& [heading, lines] : promised) {
    const auto at = found.find(heading);
    EXPECT_EQ(lines, at == found.end() ? "missing" : at->second);
  }
  for (const auto& [heading, lines] : found) EXPECT_TRUE(promised.contains(heading)) << heading;
}

// Every public name has its place in the reference.
TEST(Surface, IsInTheReference) {
  const std::string reference = Reference();
  for (const auto& [heading, part] : PartsOf(kSurface)) {
    const std::size_t kindLength = heading.find(' ');
    std::string owner = heading.substr(heading.find_first_not_of("_ ", kindLength));
    owner.resize(std::min(owner.size(), owner.find(' ')));
    const std::string section = SectionOf(reference, owner);
    EXPECT_NE(section, "") << heading;
    std::istringstream lines(part.substr(heading.size() + 1));
    for (std::string line; std::getline(lines, line);) {
      // A method has its entry with its parameters; elsewhere it may just be mentioned.
      const std::string member = heading.starts_with("events") ? line.substr(line.find(' ') + 1) : line;
      const std::size_t end = std::min(member.size(), member.find_first_of("(:"));
      const std::string entry = "`" + member.substr(0, end) + (member[end] == '(' ? "(" : "`");
      EXPECT_NE(section.find(entry), std::string::npos) << entry << " of " << heading;
    }
  }
}

}  // namespace
}  // namespace tarnwick::test
