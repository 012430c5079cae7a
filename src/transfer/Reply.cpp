#include "transfer/Reply.h"

#include <utf8.h>

#include <algorithm>
#include <array>
#include <bit>
#include <cstring>
#include <limits>
#include <utility>

#include "base/RuntimeError.h"
#include "base/Secret.h"

namespace tarnwick {
namespace {

// The service knows a few dozen; each name costs much more memory than its bytes.
constexpr std::size_t kMostVariables = 1000;

// Values of the hexadecimal digits, -1 for all other bytes.
constexpr auto kHexDigits = [] {
  std::array<short, 256> digits{};
  digits.fill(-1);
  for (unsigned i = 0; i < 10; ++i) digits['0' + i] = static_cast<short>(i);
  for (unsigned i = 0; i < 6; ++i) digits['A' + i] = digits['a' + i] = static_cast<short>(10 + i);
  return digits;
}();

// Most bytes of a reply stand for themselves, and all of those with a meaning come before them.
constexpr unsigned char kLastWithMeaning = '+';

static_assert(std::endian::native == std::endian::little, "the first byte of a word is its lowest");

// How many bytes of `word` come before the first one that has a meaning; 8 when none has one.
constexpr unsigned FirstWithMeaning(std::uint64_t word) {
  constexpr std::uint64_t kEach = 0x0101'0101'0101'0101;
  // A borrow spoils the bytes above one that is found, and never makes one where none is.
  const std::uint64_t found = (word - kEach * (kLastWithMeaning + 1U)) & ~word & (kEach * 0x80);
  return static_cast<unsigned>(std::countr_zero(found)) / 8;
}

// Unescapes what stands from `source` to `end` or to the first '&', where `source` is then, to `to`, at
// `source` or before: it never gets longer. Returns where it ends; null when an escape is broken or the bytes
// are not UTF-8.
char* Unescape(char*& source, const char* end, char* to) {
  const char* const begin = to;
  // What is written to characters may be anywhere, `source` too, but not in a register.
  char* from = source;
  std::uint64_t seen = 0;
  while (from != end) {
    // Eight at a time: the bytes of a long listing are most of the work.
    if (end - from >= 8) {
      std::uint64_t word = 0;
      std::memcpy(&word, from, sizeof word);
      const unsigned plain = FirstWithMeaning(word);
      if (plain == 8) {
        std::memcpy(to, &word, sizeof word);
        seen |= word;
        from += 8;
        to += 8;
        continue;
      }
      // Those before the meaning, and behind them what is not read yet and must stay as it is.
      const std::uint64_t rest = ~std::uint64_t{0} << (8 * plain);
      const unsigned half = 4 * static_cast<unsigned>(std::min<std::ptrdiff_t>(from - to, 8));
      const std::uint64_t written = (word & ~rest) | (((word << half) << half) & rest);
      std::memcpy(to, &written, sizeof written);
      seen |= word & ~rest;
      from += plain;
      to += plain;
    }
    unsigned byte = static_cast<unsigned char>(*from);
    if (byte == '&') break;
    if (byte == '+') byte = ' ';
    if (byte == '%') {
      if (end - from < 3) return nullptr;
      const int high = kHexDigits[static_cast<unsigned char>(from[1])];
      const int low = kHexDigits[static_cast<unsigned char>(from[2])];
      if (high < 0 || low < 0) return nullptr;
      byte = static_cast<unsigned>(high * 16 + low);
      from += 2;
    }
    ++from;
    seen |= byte;
    *to++ = static_cast<char>(byte);
  }
  source = from;
  const bool ascii = (seen & 0x8080'8080'8080'8080) == 0;
  return ascii || utf8::is_valid(std::string_view(begin, to)) ? to : nullptr;
}

// What values of an array begin with, as it was sent and as it is meant: the addresses of a listing have
// their folder, which is most of their bytes, and most of its bytes are escapes.
struct Beginning {
  std::string sent, meant;

  // Of an array with a value at `from`: all through its last slash. A single value, which may be a secret, is
  // not copied.
  void Learn(const char* from, const char* end) {
    const std::string_view value(from, std::find(from, end, '&'));
    constexpr std::string_view kSlash = "%2F";
    const std::size_t slash = value.rfind(kSlash);
    sent = value.substr(0, slash == value.npos ? 0 : slash + kSlash.size());
    meant = sent;
    char* begin = meant.data();
    const char* const stop = Unescape(begin, begin + meant.size(), begin);
    if (!stop) return sent.clear();
    meant.resize(static_cast<std::size_t>(stop - meant.data()));
  }
};

// Some replies tell a user's key; long ones list files.
void WipeAndDelete(std::string* body) noexcept {
  constexpr std::size_t kLong = 64 * 1024;
  if (body->size() < kLong) Wipe(*body);
  delete body;
}

}  // namespace

Reply Reply::FromBody(std::string body) {
  if (body.size() > std::numeric_limits<std::uint32_t>::max()) return {};
  const std::shared_ptr<std::string> bytes(new std::string(std::move(body)), WipeAndDelete);
  Reply reply;
  reply.body_ = bytes;
  char* from = bytes->data();
  char* const end = from + bytes->size() - (bytes->ends_with("\r\n") ? 2 : 0);
  // Arrays come in a row, so the name seldom changes. Empty when the next one is to be looked up anyway.
  std::string_view lastName;
  Values* values = nullptr;
  Beginning beginning;
  while (from != end) {
    if (*from == '&') {
      ++from;
      continue;
    }
    const std::string_view rest(from, end);
    const bool again =
        !lastName.empty() && rest.starts_with(lastName) && rest.substr(lastName.size()).starts_with('=');
    if (again) {
      from += lastName.size();
    } else {
      const std::size_t length = std::min(rest.find_first_of("=&"), rest.size());
      char* const begin = from;
      const char* const stop = Unescape(from, from + length, from);
      if (!stop) return {};
      const std::string_view name(begin, stop);
      values = &reply.variables_[name];
      if (reply.variables_.size() > kMostVariables) return {};
      // What had escapes is overwritten, and would pass for another name.
      lastName = name.size() == length ? name : std::string_view();
    }
    if (from == end || *from == '&') continue;
    char* const begin = ++from;
    char* to = begin;
    if (again && values->places_.size() == 1) {
      beginning.Learn(from, end);
    } else if (again && !beginning.sent.empty() && std::string_view(from, end).starts_with(beginning.sent)) {
      to = std::copy(beginning.meant.begin(), beginning.meant.end(), to);
      from += beginning.sent.size();
    }
    const char* const stop = Unescape(from, end, to);
    if (!stop) return {};
    values->body_ = bytes->data();
    values->places_.push_back(
        {static_cast<std::uint32_t>(begin - values->body_), static_cast<std::uint32_t>(stop - begin)});
  }
  const auto error = reply.variables_.find("ErrorOccured");
  reply.failed_ = error != reply.variables_.end() && !error->second.empty() && error->second.front() == "1";
  return reply;
}

const Reply::Values* Reply::GetValueByVariableName(TextView name) const {
  const auto variable = variables_.find(Utf8FromText(name));
  return variable == variables_.end() ? nullptr : &variable->second;
}

Text Reply::First(TextView name) const {
  const Values* values = GetValueByVariableName(name);
  if (!values || values->empty()) throw RuntimeError(error::kSubscriptOutOfRange);
  return TextFromWtf8(values->front());
}

}  // namespace tarnwick
