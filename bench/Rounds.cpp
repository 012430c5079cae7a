#include "Rounds.h"

#include <algorithm>
#include <bit>
#include <chrono>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <random>
#include <thread>

namespace tarnwick::bench {
namespace {

constexpr int kRounds = 15;

// Of each round of the last Measure.
std::vector<double> freeProcessors;

// About 10 ms.
void Spin() {
  std::uint64_t value = 1;
  for (int i = 0; i < 5'000'000; ++i) value = std::rotl(value, 7) * 0x9E37'79B9'7F4A'7C15;
  if (value == 0) Stop("the multiplication is wrong");
}

double FreeNow() {
  const double one = Seconds(Spin);
  const double two = Seconds([] {
    std::thread other(Spin);
    Spin();
    other.join();
  });
  return 2 * one / two;
}

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
  freeProcessors.clear();
  for (int round = 0; round <= kRounds; ++round) {
    if (round > 0) freeProcessors.push_back(FreeNow());
    std::shuffle(order.begin(), order.end(), random);
    for (Side* side : order) {
      const double cost = side->run() / side->units;
      if (round > 0) side->costs.push_back(cost);
    }
  }
}

Side FreeProcessors() {
  return {"library", {}, 1, freeProcessors};
}

const char* BoundByProcessors(const char* two, const char* one) {
  std::vector<double> sorted = freeProcessors;
  std::ranges::sort(sorted);
  return sorted[sorted.size() / 2] > 1.4 ? two : one;
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
