#pragma once

#include <chrono>

#include "base/Text.h"

namespace tarnwick {

// The date that day, month and year mean as they stand in a directory listing. The month is "Jan" to "Dec".
// In place of the year there may be a time of day ("12:30"), which means `currentYear`; years below 30 are
// those from 2000 on, below 100 those from 1930 on. A day that the month lacks counts on into the next one.
// Throws 13 for what is no number or no month, 5 for a year after 9999 or before 0.
std::chrono::sys_days DirectoryDate(TextView day, TextView month, TextView year, int currentYear);

}  // namespace tarnwick
