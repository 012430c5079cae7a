// Walks through what both controls do, as a user would, and has a picture of the screen taken after each
// step.
#pragma once

#include "DemoHost.h"

namespace tarnwick::demo {

class Tour {
 public:
  explicit Tour(DemoHost& host) : host_(host) {}

  // Whether all went as it should; the log tells what did not. The account is then as it was.
  bool Run();

 private:
  void ShowList();
  void ShowThumbnails();
  void RenameAndDelete();
  void ShowEmptyAccount();

  void Expect(bool happened, const wchar_t* what);
  // One step is over: the picture of it is taken.
  void Step(const wchar_t* name);
  // Presses a button of the tool bar.
  void Do(Command command);
  // Uploads a picture that the account does not have yet.
  void Upload();
  // Renames the selected file in place; `step` is the picture with the editor open.
  void TypeName(const wchar_t* name, const wchar_t* step);
  void Download();
  // Runs `steps` in an account without files, made for as long as they take.
  void WithEmptyAccount(const std::function<void()>& steps);

  HWND Grid();
  // Pictures on the thumbnail page.
  std::vector<HWND> Pictures();
  // The one with that caption; null when the page does not have it.
  HWND Picture(const wchar_t* caption);
  // Presses the mouse on it; whether it is selected then.
  bool Press(HWND picture);
  // Whether the thumbnail page shows the last `count` pictures of the account that make a page.
  bool ShowsLastOf(int count);
  void ScrollToEnd();

  DemoHost& host_;
  bool well_ = true;
  // Files of the account: all, and those that pass a filter.
  int all_ = 0;
  int gif_ = 0;
  int jpg_ = 0;
};

}  // namespace tarnwick::demo
