// A window that is never shown and only takes messages, for what tells its events that way.
#pragma once

#include <functional>

#include "platform/windows/Owner.h"

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
  Owner<HWND, DestroyWindow> window_;
};

}  // namespace tarnwick
