// A window that is never shown and only takes messages, for what tells its events that way.
#pragma once

#include "platform/windows/WindowsHeaders.h"

#include <functional>

namespace tarnwick {

class MessageWindow {
 public:
  // Takes a message; false leaves it to the system.
  using Handler = std::function<bool(UINT message, WPARAM wParam, LPARAM lParam)>;

  explicit MessageWindow(Handler handler);
  ~MessageWindow();
  MessageWindow(const MessageWindow&) = delete;
  MessageWindow& operator=(const MessageWindow&) = delete;

  // Made on the first call, so that what is never used costs nothing; null when it could not be made.
  HWND Get();

 private:
  static LRESULT CALLBACK WindowProc(HWND window, UINT message, WPARAM wParam, LPARAM lParam);

  Handler handler_;
  HWND window_ = nullptr;
};

}  // namespace tarnwick
