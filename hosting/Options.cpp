#include "hosting/Options.h"

#include <charconv>
#include <limits>

#include "base/Text.h"
#include "hosting/Names.h"

namespace tarnwick::hosting {
namespace {

constexpr std::int64_t kMostInt32 = std::numeric_limits<std::int32_t>::max();

std::int64_t Number(std::string_view name, std::string_view text, std::int64_t most) {
  std::int64_t number = 0;
  const auto [stop, status] = std::from_chars(text.data(), text.data() + text.size(), number);
  if (status != std::errc{} || stop != text.data() + text.size() || number < 0 || number > most)
    throw OptionError(std::string(name) + " wants a number from 0 to " + std::to_string(most) + ", not \"" +
                      std::string(text) + "\"");
  return number;
}

void Check(const Options& options) {
  if (options.data.empty()) throw OptionError("--data is missing");
  if (options.seedUser.empty()) {
    if (!options.seedPassword.empty() || !options.seedPictures.empty() || options.seedProduct != 0)
      throw OptionError("--seed-password, --seed-product and --seed-pictures need --seed-user");
    return;
  }
  if (IsRefusedUserName(options.seedUser)) throw OptionError("--seed-user is no name for a user");
  if (!TextFromUtf8(options.seedPassword) || Strip(options.seedPassword).empty())
    throw OptionError("--seed-user needs a --seed-password with letters or digits");
  if (!options.seedPictures.empty() && !std::filesystem::is_directory(options.seedPictures))
    throw OptionError("--seed-pictures is no folder: " + options.seedPictures.string());
}

}  // namespace

Options ParseOptions(const std::vector<std::string_view>& arguments) {
  Options options;
  for (std::size_t i = 0; i < arguments.size(); i += 2) {
    const std::string_view name = arguments[i];
    if (name == "--help") {
      options.help = true;
      return options;
    }
    if (i + 1 == arguments.size()) throw OptionError(std::string(name) + " is unknown or lacks its value");
    const std::string_view value = arguments[i + 1];

    if (name == "--host") {
      options.host = value;
    } else if (name == "--port") {
      options.port = static_cast<int>(Number(name, value, 65535));
    } else if (name == "--data") {
      options.data = value;
    } else if (name == "--seed-user") {
      options.seedUser = value;
    } else if (name == "--seed-password") {
      options.seedPassword = value;
    } else if (name == "--seed-product") {
      options.seedProduct = Number(name, value, kMostInt32);
    } else if (name == "--seed-pictures") {
      options.seedPictures = value;
    } else if (name == "--soft-limit") {
      options.softLimit = Number(name, value, kMostInt32);
    } else if (name == "--hard-limit") {
      options.hardLimit = Number(name, value, kMostInt32);
    } else if (name == "--quota") {
      options.quota = static_cast<std::uint64_t>(Number(name, value, std::int64_t{1} << 50));
    } else if (name == "--expire-days") {
      options.expireDays = Number(name, value, 1'000'000);
    } else if (name == "--fault") {
      const auto fault = ParseFault(value);
      if (!fault) throw OptionError("--fault wants WHERE=KIND[:ARG], not \"" + std::string(value) + "\"");
      options.faults.push_back(*fault);
    } else {
      throw OptionError("unknown option " + std::string(name));
    }
  }
  Check(options);
  return options;
}

std::string_view HelpText() {
  return R"(tarnwick-hosting: a hosting server for development and tests on this machine

  --data DIR            folder of accounts, files and mails (made when it is not there); required
  --host ADDRESS        address to listen on (127.0.0.1)
  --port N              port to listen on; 0 is any free one (0). The first line printed names it.
  --seed-user NAME      account to make when it is not there yet
  --seed-password TEXT  its password
  --seed-product N      its product number; 0 fits every product (0)
  --seed-pictures DIR   its first files
  --soft-limit N        number of accounts from which a host should warn; only told (900)
  --hard-limit N        most accounts (1000)
  --quota BYTES         of each account (104857600)
  --expire-days N       period of an account; 0 makes every account an expired one (365)
  --fault WHERE=KIND[:ARG]
                        a fault to show; may be given several times
  --help                this text

WHERE is an action word (ListFiles), a page (UploadAcceptor.asp), the start of a path (/users/) or *.
KIND is one of
  refuse            the connection is closed without an answer; nothing is carried out
  reset:request     the connection is reset before the request is read (an action: before it is answered);
                    nothing is carried out
  reset:head        it is reset in the middle of the answer's head
  reset:body        it is reset half-way through the answer's body
  stall[:SECONDS]   nothing is sent for so long, or until the client goes
  drip:MS           one byte each MS milliseconds
  cut[:BYTES]       closed after half, or BYTES, of the announced body
  wrong             variables of other names; a listing's sister arrays lack their last element
  garbage           a body that is no form
  status:CODE       another status
  huge[:BYTES]      a body of more than 64 MiB, or of BYTES
  empty             200 and no body
  length:N          N as the announced length of the body
  late-close[:MS]   a whole answer that says nothing about the connection, which serves no other request and is
                    closed 20, or MS, milliseconds later
)";
}

}  // namespace tarnwick::hosting
