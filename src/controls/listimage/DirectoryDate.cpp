#include "controls/listimage/DirectoryDate.h"

#include "base/RuntimeError.h"

namespace tarnwick {
namespace {

constexpr TextView kMonths = u"JanFebMarAprMayJunJulAugSepOctNovDec";
constexpr int kLastYear = 9999;

unsigned MonthNumber(TextView month) {
  const std::size_t at = kMonths.find(month);
  if (month.size() != 3 || at == TextView::npos || at % 3 != 0) throw RuntimeError(error::kTypeMismatch);
  return static_cast<unsigned>(at / 3 + 1);
}

int YearNumber(TextView year, int currentYear) {
  if (year.find(u':') != TextView::npos) return currentYear;
  const int number = NumberFromText(year);
  if (number < 0 || number > kLastYear) throw RuntimeError(error::kInvalidCall);
  if (number < 30) return number + 2000;
  return number < 100 ? number + 1900 : number;
}

}  // namespace

std::chrono::sys_days DirectoryDate(TextView day, TextView month, TextView year, int currentYear) {
  using namespace std::chrono;
  const year_month_day first{std::chrono::year(YearNumber(year, currentYear)),
                             std::chrono::month(MonthNumber(month)), std::chrono::day(1)};
  return sys_days(first) + days(NumberFromText(day) - 1);
}

}  // namespace tarnwick
