#include "Rounds.h"

#include <algorithm>
#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <random>

namespace tarnwick::bench {
namespace {

constexpr int kRounds = 15;

void PrintSide(const Side& side) {
  std::printf("\t%s\t", side.name.c_str());
  for (const double cost : side.costs) std::printf("%.9g ", cost);
}

void PrintRow(const std::string& what, const char* unit, const char* bound, const char* rest,
              const Side& ours) {
  std::printf("row\t%s\t%s\t%s\t%s", what.c_str(), unit, bound, rest);
  PrintSide(ours);
}

}  // namespace

void Stop(const char* what) {
  std::fprintf(stderr, "bench: %s\n", what);
  std::exit(2);
}

double Seconds(const std::function<void()>& work) {
  using Clock = std::chrono::steady_clock;
  const Clock::time_point begin = Clock::now();
  work();
  return std::chrono::duration<double>(Clock::now() - begin).count();
}

void Measure(std::vector<Side>& sides) {
  std::mt19937 random;
  std::vector<Side*> order;
  order.reserve(sides.size());
  for (Side& side : sides) order.push_back(&side);
  for (int round = 0; round <= kRounds; ++round) {
    std::shuffle(order.begin(), order.end(), random);
    for (Side* side : order) {
      const double cost = side->run() / side->units;
      if (round > 0) side->costs.push_back(cost);
    }
  }
}

Side PerUnit(Side side, double units) {
  for (double& cost : side.costs) cost /= units;
  return side;
}

void Row(const std::string& what, const Side& ours, const Side& peer, const char* bound, const char* rest) {
  PrintRow(what, "s", bound, rest, ours);
  PrintSide(peer);
  std::printf("\n");
}

void Row(const std::string& what, const Side& ours, const char* unit, const char* bound, const char* rest) {
  PrintRow(what, unit, bound, rest, ours);
  std::printf("\n");
}

}  // namespace tarnwick::bench
