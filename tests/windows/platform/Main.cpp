// After each test nothing of the system's is held any more.
#include "platform/windows/WindowsHeaders.h"

#include <gtest/gtest.h>

#include "platform/windows/Owner.h"

namespace tarnwick {
namespace {

class NothingIsHeld : public testing::EmptyTestEventListener {
  int before_ = 0;

  void OnTestStart(const testing::TestInfo&) override { before_ = ownedObjects; }
  void OnTestEnd(const testing::TestInfo&) override {
    // A call that blocks may have been left behind; it ends when the peer has gone.
    for (int i = 0; i < 500 && ownedObjects != before_; ++i) Sleep(10);
    EXPECT_EQ(ownedObjects, before_);
  }
};

}  // namespace
}  // namespace tarnwick

int main(int count, char** arguments) {
  testing::InitGoogleTest(&count, arguments);
  testing::UnitTest::GetInstance()->listeners().Append(new tarnwick::NothingIsHeld);
  return RUN_ALL_TESTS();
}
