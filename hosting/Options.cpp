#include "hosting/Options.h"

#include <CLI/CLI.hpp>
#include <algorithm>
#include <limits>

#include "base/Text.h"
#include "hosting/Names.h"

namespace tarnwick::hosting {
namespace {

constexpr std::int64_t kMostInt32 = std::numeric_limits<std::int32_t>::max();

constexpr const char* kFaults = R"(
WHERE is an action word (ListFiles), a page (UploadAcceptor.asp), the start of a path (/users/) or *.
KIND is one of
  refuse            the connection is closed without an answer; nothing is carried out
  reset:request     the connection is reset before the request is read (an action: before it is answered);
                    nothing is carried out
  reset:head        it is reset in the middle of the answer's head
  reset:body        it is reset half-way through the answer's body
  stall[:SECONDS]   nothing is sent for so long, or until the client goes
  stall:handshake   the same for every connection before it is one of TLS; WHERE is *
  drip:MS           one byte each MS milliseconds
  cut[:BYTES]       closed after half, or BYTES, of the announced body; over TLS without a close-notify
  wrong             variables of other names; a listing's sister arrays lack their last element
  garbage           a body that is no form
  status:CODE       another status
  huge[:BYTES]      a body of more than 64 MiB, or of BYTES
  empty             200 and no body
  length:N          N as the announced length of the body; more than there is ends early, over TLS with a
                    close-notify
  late-close[:MS]   a whole answer that says nothing about the connection, which serves no other request and is
                    closed 20, or MS, milliseconds later)";

// The messages of these checks follow the option's name.
std::string CheckUserName(const std::string& name) {
  return IsRefusedUserName(name) ? "no name for a user" : "";
}
std::string CheckPassword(const std::string& password) {
  return TextFromUtf8(password) && !Strip(password).empty() ? "" : "wants letters or digits";
}
std::string CheckFault(const std::string& fault) {
  return ParseFault(fault) ? "" : "wants WHERE=KIND[:ARG], not \"" + fault + "\"";
}
// The library would take 010 for 8 and 0x10 for 16.
std::string CheckDecimal(const std::string& number) {
  const bool leadingZero = number.size() > 1 && number.starts_with('0');
  return leadingZero || number.find_first_not_of("0123456789") != std::string::npos
             ? "wants a decimal number, not \"" + number + "\""
             : "";
}
std::string CheckNotEmpty(const std::string& value) {
  return value.empty() ? "is empty" : "";
}

// Of an IPv6 address, whose parts ":" separates like a port.
std::string WithoutBrackets(const std::string& host) {
  return host.starts_with('[') && host.ends_with(']') ? host.substr(1, host.size() - 2) : host;
}

}  // namespace

std::string ServerName(const Options& options, int port) {
  const bool isIpv6 = options.host.find(':') != std::string::npos;
  return (options.HasTls() ? "https://" : "") + (isIpv6 ? "[" + options.host + "]" : options.host) + ":" +
         std::to_string(port);
}

Options ParseOptions(std::vector<std::string> arguments) {
  Options options;
  CLI::App app("A hosting server for development and tests on this machine", "tarnwick-hosting");
  app.set_help_flag("--help", "this text");
  app.footer(kFaults);
  // Whoever calls a script that starts the server can give an option once more.
  app.option_defaults()->take_last();
  const auto number = [&](const std::string& name, auto& value, std::int64_t most, const std::string& what) {
    return app.add_option(name, value, what)
        ->type_name("N")
        ->check(CheckDecimal)
        ->check(CLI::Range(std::int64_t{0}, most).description(""))
        ->capture_default_str();
  };

  app.add_option("--data", options.data, "folder of accounts, files and mails (made when it is not there)")
      ->type_name("DIR")
      ->check(CheckNotEmpty)
      ->required();
  app.add_option("--host", options.host, "address to listen on, such as [::1]")
      ->type_name("ADDRESS")
      ->check(CheckNotEmpty)
      ->capture_default_str();
  number("--port", options.port, 65'535,
         "port to listen on; 0 is any free one. The line \"listening on\" names it.");
  CLI::Option* const certificate =
      app.add_option("--tls-certificate", options.tlsCertificate,
                     "serve TLS with this certificate (PEM; those between it and its authority after it)")
          ->type_name("FILE")
          ->check(CheckNotEmpty);
  CLI::Option* const key = app.add_option("--tls-key", options.tlsKey, "its key (PEM)")
                               ->type_name("FILE")
                               ->check(CheckNotEmpty)
                               ->needs(certificate);
  certificate->needs(key);
  app.add_flag("--tls-self-signed", options.tlsSelfSigned,
               "serve TLS with a certificate for ADDRESS and loopback that is made for three days, and print "
               "where its authority's is")
      ->excludes(certificate);
  CLI::Option* const user =
      app.add_option("--seed-user", options.seedUser, "account to make when it is not there yet")
          ->type_name("NAME")
          ->check(CheckUserName);
  CLI::Option* const password = app.add_option("--seed-password", options.seedPassword, "its password")
                                    ->type_name("TEXT")
                                    ->check(CheckPassword)
                                    ->needs(user);
  user->needs(password);
  number("--seed-product", options.seedProduct, kMostInt32, "its product number; 0 fits every product")
      ->needs(user);
  app.add_option("--seed-pictures", options.seedPictures, "its first files")
      ->type_name("DIR")
      ->check(CLI::ExistingDirectory.description(""))
      ->needs(user);
  number("--soft-limit", options.softLimit, kMostInt32,
         "number of accounts from which a host should warn; only told");
  number("--hard-limit", options.hardLimit, kMostInt32, "most accounts");
  number("--quota", options.quota, std::int64_t{1} << 50, "bytes of each account");
  number("--expire-days", options.expireDays, 1'000'000,
         "period of an account; 0 makes every account an expired one");
  std::vector<std::string> faults;
  app.add_option("--fault", faults, "a fault to show; may be given several times")
      ->type_name("WHERE=KIND[:ARG]")
      ->check(CheckFault)
      ->take_all()
      ->allow_extra_args(false);

  try {
    // The last one is read first.
    std::reverse(arguments.begin(), arguments.end());
    app.parse(std::move(arguments));
  } catch (const CLI::CallForHelp&) {
    options.help = app.help();
  } catch (const CLI::ParseError& error) {
    throw OptionError(error.what());
  }
  options.host = WithoutBrackets(options.host);
  for (const std::string& fault : faults) options.faults.push_back(*ParseFault(fault));
  return options;
}

}  // namespace tarnwick::hosting
