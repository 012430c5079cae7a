// The scroll bar's hook: what it takes from a window and what it passes on.
#include <gtest/gtest.h>

#include <tuple>
#include <vector>

#include "support/ScrollBarHook.h"

namespace tarnwick {
namespace {

constexpr ProcedureAddress kClassProcedure = 0x5000;

class FakeProcedures : public WindowProcedures {
 public:
  ProcedureAddress previous = kClassProcedure;
  std::vector<WindowHandle> hooked;
  std::vector<std::tuple<ProcedureAddress, WindowHandle, std::uint32_t, std::uintptr_t, std::intptr_t>> calls;

  ProcedureAddress SetHook(WindowHandle window) override {
    hooked.push_back(window);
    return previous;
  }
  std::intptr_t Call(ProcedureAddress procedure, WindowHandle window, std::uint32_t message,
                     std::uintptr_t first, std::intptr_t second) override {
    calls.emplace_back(procedure, window, message, first, second);
    return static_cast<std::intptr_t>(message) - second;
  }
};

TEST(ScrollBarHook, TakesOneMessageAndPassesTheOthersUnchanged) {
  ScrollHookState state;
  state.window = 7;
  FakeProcedures procedures;
  ScrollBarHook hook(state, procedures);
  hook.Install();

  EXPECT_EQ(hook.Answer(7, 0x0137, 1, 2), 0);
  EXPECT_TRUE(procedures.calls.empty());
  // The neighbours are colour requests as well.
  for (const std::uint32_t message :
       {0x0132U, 0x0133U, 0x0134U, 0x0135U, 0x0136U, 0x0138U, 0x0000U, 0xFFFFU}) {
    procedures.calls.clear();
    EXPECT_EQ(hook.Answer(7, message, UINTPTR_MAX, -5), static_cast<std::intptr_t>(message) + 5);
    ASSERT_EQ(procedures.calls.size(), 1U);
    EXPECT_EQ(procedures.calls[0], std::make_tuple(kClassProcedure, 7U, message, UINTPTR_MAX, -5));
  }
}

TEST(ScrollBarHook, HooksAgainOnlyWhenTheNextControlClearsTheFlag) {
  ScrollHookState state;
  state.window = 7;
  FakeProcedures procedures;
  ScrollBarHook hook(state, procedures);
  hook.Install();
  procedures.previous = 0x6000;
  state.window = 8;
  hook.Install();
  EXPECT_EQ(procedures.hooked, std::vector<WindowHandle>{7});
  EXPECT_EQ(state.previous, kClassProcedure);

  state.hooked = false;
  hook.Install();
  EXPECT_EQ(procedures.hooked, (std::vector<WindowHandle>{7, 8}));
  EXPECT_TRUE(state.hooked);
  // The one address that is kept serves both windows.
  hook.Answer(7, 1, 0, 0);
  EXPECT_EQ(std::get<0>(procedures.calls.at(0)), 0x6000U);
}

TEST(ScrollBarHook, CountsAsHookedWhenTheSystemRefuses) {
  ScrollHookState state;
  FakeProcedures procedures;
  procedures.previous = 0;
  ScrollBarHook hook(state, procedures);
  hook.Install();
  hook.Install();
  EXPECT_EQ(procedures.hooked.size(), 1U);
  EXPECT_TRUE(state.hooked);
  hook.Answer(7, 1, 0, 0);
  EXPECT_EQ(std::get<0>(procedures.calls.at(0)), 0U);
}

}  // namespace
}  // namespace tarnwick
