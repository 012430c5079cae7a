#include "hosting/Faults.h"

#include <algorithm>
#include <charconv>
#include <iterator>

namespace tarnwick::hosting {
namespace {

using Kind = Fault::Kind;

enum class Argument { kNone, kMayBe, kMust };

struct KindWord {
  std::string_view word;
  Kind kind;
  Argument argument;
};

constexpr KindWord kKinds[] = {
    {"refuse", Kind::kRefuse, Argument::kNone},
    {"reset:request", Kind::kResetRequest, Argument::kNone},
    {"reset:head", Kind::kResetHead, Argument::kNone},
    {"reset:body", Kind::kResetBody, Argument::kNone},
    {"stall:handshake", Kind::kStallHandshake, Argument::kNone},
    {"stall", Kind::kStall, Argument::kMayBe},
    {"drip", Kind::kDrip, Argument::kMust},
    {"cut", Kind::kCut, Argument::kMayBe},
    {"wrong", Kind::kWrong, Argument::kNone},
    {"garbage", Kind::kGarbage, Argument::kNone},
    {"status", Kind::kStatus, Argument::kMust},
    {"huge", Kind::kHuge, Argument::kMayBe},
    {"empty", Kind::kEmpty, Argument::kNone},
    {"length", Kind::kLength, Argument::kMust},
    {"late-close", Kind::kLateClose, Argument::kMayBe},
};

// Enough for a week in milliseconds and for every size that a client should refuse.
constexpr std::uint64_t kMostAmount = std::uint64_t{1} << 40;
constexpr std::uint64_t kMostDelay = 604'800'000;

bool IsInRange(Kind kind, std::uint64_t amount) {
  if (kind == Kind::kStatus) return amount >= 200 && amount <= 599;
  if (kind == Kind::kDrip || kind == Kind::kLateClose) return amount <= kMostDelay;
  if (kind == Kind::kStall) return amount <= kMostDelay / 1000;
  return amount <= kMostAmount;
}

template <typename Matches>
std::vector<Fault> Select(const std::vector<Fault>& faults, Matches matches) {
  std::vector<Fault> selected;
  std::copy_if(faults.begin(), faults.end(), std::back_inserter(selected), matches);
  return selected;
}

}  // namespace

std::optional<Fault> ParseFault(std::string_view text) {
  const std::size_t equals = text.rfind('=');
  if (equals == 0 || equals == std::string_view::npos) return std::nullopt;
  Fault fault;
  fault.where = text.substr(0, equals);
  const std::string_view what = text.substr(equals + 1);
  for (const KindWord& known : kKinds) {
    if (!what.starts_with(known.word)) continue;
    fault.kind = known.kind;
    // What is asked for is known only after the handshake.
    if (known.kind == Kind::kStallHandshake && fault.where != "*") return std::nullopt;
    std::string_view rest = what.substr(known.word.size());
    if (rest.empty()) {
      if (known.argument == Argument::kMust) return std::nullopt;
      return fault;
    }
    if (rest.front() != ':' || known.argument == Argument::kNone) return std::nullopt;
    rest.remove_prefix(1);
    std::uint64_t amount = 0;
    const auto [stop, status] = std::from_chars(rest.data(), rest.data() + rest.size(), amount);
    if (status != std::errc{} || stop != rest.data() + rest.size() || !IsInRange(known.kind, amount))
      return std::nullopt;
    fault.amount = amount;
    return fault;
  }
  return std::nullopt;
}

std::vector<Fault> FaultsForPath(const std::vector<Fault>& faults, std::string_view path) {
  const std::string_view page = path.substr(path.rfind('/') + 1);
  return Select(faults, [&](const Fault& fault) {
    return fault.where == "*" || (fault.where.starts_with('/') && path.starts_with(fault.where)) ||
           fault.where == page;
  });
}

bool StallsHandshakes(const std::vector<Fault>& faults) {
  return std::any_of(faults.begin(), faults.end(),
                     [](const Fault& fault) { return fault.kind == Kind::kStallHandshake; });
}

std::vector<Fault> FaultsForAction(const std::vector<Fault>& faults, std::string_view action) {
  return Select(faults, [&](const Fault& fault) { return fault.where == action; });
}

FormBody WrongForm(const FormBody& form) {
  const auto& variables = form.Variables();
  const bool isListing =
      variables.size() > 1 && variables.front().first == "FileName" && !variables.front().second.empty();
  FormBody wrong;
  for (const auto& [name, values] : variables) {
    if (!isListing)
      wrong.Add("Other" + name, values);
    else if (&name == &variables.front().first)
      wrong.Add(name, values);
    else
      wrong.Add(name, std::vector<std::string>(values.begin(), std::prev(values.end())));
  }
  return wrong;
}

}  // namespace tarnwick::hosting
