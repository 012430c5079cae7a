#include "hosting/Answers.h"

#include <algorithm>
#include <map>
#include <memory>
#include <string>

#include "base/Text.h"

namespace tarnwick::hosting {
namespace {

using Kind = Fault::Kind;

constexpr std::size_t kBlock = 256 * 1024;
constexpr std::uint64_t kHugeBytes = (std::uint64_t{64} << 20) + 4096;

// Broken escapes, bytes that are no UTF-8, names without text.
constexpr const char* kGarbage = "%zz=%&%E9%4=\xFF\xC0&=&\x01\x7F\x80;\n\xFE&ErrorNumber=&%";

std::string PictureType(std::string_view name) {
  static const std::map<std::string, std::string> types = {{"jpg", "image/jpeg"}, {"jpeg", "image/jpeg"},
                                                           {"gif", "image/gif"},  {"png", "image/png"},
                                                           {"bmp", "image/bmp"},  {"tif", "image/tiff"}};
  const std::string_view extension = name.substr(name.rfind('.') + 1);
  const auto type = types.find(Utf8FromText(LowerCase(TextFromLatin1(extension))));
  return type == types.end() ? "application/octet-stream" : type->second;
}

// A form that is right but for its size.
void SetHuge(httplib::Response& answer, const std::string& text, std::uint64_t length) {
  const std::string start = text + "&Filler=";
  answer.set_content_provider(
      length, kFormType, [start](std::size_t offset, std::size_t left, httplib::DataSink& sink) {
        std::string block = offset < start.size() ? start.substr(offset) : std::string(kBlock, 'x');
        block.resize(std::min(block.size(), left));
        return sink.write(block.data(), block.size());
      });
}

// Sets the status that the faults want, and the body, of which `text` is the form. False when the body is to
// be what it was.
bool Spoil(httplib::Response& answer, const std::string& text, const std::vector<Fault>& faults) {
  bool isSpoilt = false;
  for (const Fault& fault : faults) {
    if (fault.kind == Kind::kStatus) {
      answer.status = static_cast<int>(*fault.amount);
      continue;
    }
    if (fault.kind == Kind::kEmpty)
      answer.set_content("", kFormType);
    else if (fault.kind == Kind::kGarbage)
      answer.set_content(kGarbage, kFormType);
    else if (fault.kind == Kind::kHuge)
      SetHuge(answer, text, fault.amount.value_or(kHugeBytes));
    else
      continue;
    isSpoilt = true;
  }
  return isSpoilt;
}

}  // namespace

void SetForm(httplib::Response& answer, FormBody form, const std::vector<Fault>& faults) {
  answer.status = 200;
  for (const Fault& fault : faults)
    if (fault.kind == Kind::kWrong) form = WrongForm(form);
  const std::string text = form.Text();
  if (!Spoil(answer, text, faults)) answer.set_content(text, kFormType);
}

void SetPicture(httplib::Response& answer, FileHandle file, std::string_view name,
                const std::vector<Fault>& faults) {
  answer.status = 200;
  if (Spoil(answer, {}, faults)) return;
  const std::uint64_t size = SizeOf(file);
  if (size == 0) {  // the library takes a provider of nothing for none
    answer.set_content("", PictureType(name));
    return;
  }
  // The library copies the function.
  const auto shared = std::make_shared<FileHandle>(std::move(file));
  answer.set_content_provider(size, PictureType(name),
                              [shared](std::size_t offset, std::size_t left, httplib::DataSink& sink) {
                                std::string block(std::min(left, kBlock), '\0');
                                const std::size_t got = ReadAt(*shared, block.data(), block.size(), offset);
                                return got > 0 && sink.write(block.data(), got);
                              });
}

}  // namespace tarnwick::hosting
