#include "platform/windows/AnsiText.h"

#include "base/Secret.h"
#include "platform/windows/WindowsHeaders.h"

namespace tarnwick {

std::optional<std::string> AnsiFromText(TextView text) {
  if (text.find(u'\0') != TextView::npos) return std::nullopt;
  std::wstring wide = WideFromText(text);
  const int units = static_cast<int>(wide.size());
  std::string bytes;
  if (units == 0) return bytes;
  const int size = WideCharToMultiByte(CP_ACP, 0, wide.data(), units, nullptr, 0, nullptr, nullptr);
  bytes.resize(static_cast<std::size_t>(size));
  WideCharToMultiByte(CP_ACP, 0, wide.data(), units, bytes.data(), size, nullptr, nullptr);
  // Compared on the way back, because a code page that is UTF-8 does not take the flags that would tell, and
  // a look-alike character is a loss as well.
  Text back = TextFromAnsi(bytes);
  const bool isWhole = back == text;
  // It may be a password.
  Wipe(wide);
  Wipe(back);
  if (!isWhole) return std::nullopt;
  return bytes;
}

Text TextFromAnsi(std::string_view bytes) {
  if (bytes.empty()) return {};
  const int size = static_cast<int>(bytes.size());
  std::wstring wide(bytes.size(), L'\0');
  // No code page has more units than bytes.
  const int units = MultiByteToWideChar(CP_ACP, 0, bytes.data(), size, wide.data(), size);
  Text text = TextFromWide({wide.data(), static_cast<std::size_t>(units)});
  Wipe(wide);
  return text;
}

}  // namespace tarnwick
