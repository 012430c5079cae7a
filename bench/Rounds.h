// Rounds in which the library and what it is compared with take turns, and the rows that bench/table.py
// judges.
#pragma once

#include <functional>
#include <string>
#include <vector>

namespace tarnwick::bench {

// Ends the program with 2.
[[noreturn]] void Stop(const char* what);

// By the clock on the wall.
double Seconds(const std::function<void()>& work);

struct Side {
  std::string name;
  // Does the work once and returns what it cost: seconds, unless the row says otherwise. What is to be made
  // ready before goes unmeasured.
  std::function<double()> run;
  // The cost is told for one of these: of bytes, files or characters.
  double units = 1;
  std::vector<double> costs = {};
};

// One round whose costs are dropped, and 15 that count. In each all sides run once, in an order of its own,
// so that a busy moment of the machine meets all alike.
void Measure(std::vector<Side>& sides);

// How many processors other programs left free in each round of the last Measure, about 1 to 2.
Side FreeProcessors();
// `two` if as a rule both were free then, else `one`: what work on two threads gains depends on that.
const char* BoundByProcessors(const char* two, const char* one);

// The side, which was measured for the whole, with its costs for one of so many units.
Side PerUnit(Side side, double units);

// Prints a row. `bound` is ">=1.4" for times as fast as the peer, "<=1.4" for times the peer's cost, or ""
// for a peer that is only shown. `rest` says what the remaining difference consists of.
void Row(const std::string& what, const Side& ours, const Side& peer, const char* bound, const char* rest);
// A figure of its own, in the unit "s" or "x". `bound` is "<=" and a figure, or "".
void Row(const std::string& what, const Side& ours, const char* unit, const char* bound, const char* rest);

}  // namespace tarnwick::bench
