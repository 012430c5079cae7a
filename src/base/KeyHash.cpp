#include "base/KeyHash.h"

#include <bit>
#include <cstring>
#include <random>

namespace tarnwick {
namespace {

struct SipState {
  std::uint64_t v0, v1, v2, v3;

  void Round() {
    v0 += v1;
    v2 += v3;
    v1 = std::rotl(v1, 13) ^ v0;
    v3 = std::rotl(v3, 16) ^ v2;
    v0 = std::rotl(v0, 32);
    v2 += v1;
    v0 += v3;
    v1 = std::rotl(v1, 17) ^ v2;
    v3 = std::rotl(v3, 21) ^ v0;
    v2 = std::rotl(v2, 32);
  }
  void Take(std::uint64_t block) {
    v3 ^= block;
    Round();
    v0 ^= block;
  }
};

HashKey RandomKey() {
  std::random_device random;
  const auto draw = [&] { return std::uint64_t{random()} << 32 | random(); };
  return {draw(), draw()};
}

}  // namespace

std::uint64_t KeyedHash(std::string_view bytes, const HashKey& key) {
  SipState state = {key.low ^ 0x736f6d6570736575, key.high ^ 0x646f72616e646f6d, key.low ^ 0x6c7967656e657261,
                    key.high ^ 0x7465646279746573};
  // The highest byte of the last block is the length.
  std::uint64_t last = std::uint64_t{bytes.size()} << 56;
  std::uint64_t block = 0;
  for (; bytes.size() >= sizeof block; bytes.remove_prefix(sizeof block)) {
    std::memcpy(&block, bytes.data(), sizeof block);
    state.Take(block);
  }
  for (std::size_t i = 0; i < bytes.size(); ++i)
    last |= std::uint64_t{static_cast<unsigned char>(bytes[i])} << (8 * i);
  state.Take(last);
  state.v2 ^= 0xff;
  for (int i = 0; i < 3; ++i) state.Round();
  return state.v0 ^ state.v1 ^ state.v2 ^ state.v3;
}

std::size_t ProcessHash::operator()(std::string_view bytes) const {
  static const HashKey key = RandomKey();
  return static_cast<std::size_t>(KeyedHash(bytes, key));
}

}  // namespace tarnwick
