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
  void ShowAccount();
  void ShowUploads();
  void ShowMenuAndPicture();
  void ShowListChanges();
  void ShowThumbnailChanges();
  void ShowEmptyAccount();
  void CloseUnderWay();

  void Expect(bool happened, const wchar_t* what);
  // One step is over: the picture of it is taken.
  void Step(const wchar_t* name);
  // Presses a button of the tool bar.
  void Do(Command command);
  // Runs `meanwhile` when a window of that class, a menu or a dialog, has opened in what `act` does.
  void While(const wchar_t* kind, const std::function<void()>& act, std::function<void(HWND)> meanwhile);
  // Moves the pointer there; a menu opens where it is.
  void PointAt(HWND window, POINT at);
  // Deletes what is selected, by `act`; `step` is the picture of the question before it.
  void DeleteAndAnswer(const std::function<void()>& act, int answer, const wchar_t* step);
  // Whether a picture has been opened in a window of its own, which it closes.
  bool ClosePicture();
  std::wstring UploadPath() const;
  // Uploads a picture that the account does not have yet.
  void Upload();
  // Drops the same one on that window.
  void Drop(HWND window);
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
  // Presses a mouse button on it; whether it is selected then.
  bool Press(HWND picture, UINT button = WM_LBUTTONDOWN);
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
