// The form with both controls side by side. The commands of its tool bar and its menu act on the control that
// was used last, and what they change the other control shows as well.
#pragma once

#include "FilePane.h"
#include "PictureWindow.h"

#include <cstdio>
#include <string>
#include <vector>

#include "platform/windows/Owner.h"

namespace tarnwick::demo {

enum Command : int { kUpload = 100, kOpen, kRename, kDelete, kDownload, kAll, kGif, kJpg, kStop };

class DemoHost {
 public:
  // The program's arguments, in their order.
  enum Input : std::size_t { kServer, kUser, kPassword, kProduct, kPictures, kDownloads, kLog, kShots };

  explicit DemoHost(std::vector<std::wstring> arguments) : arguments_(std::move(arguments)) {}
  ~DemoHost();
  DemoHost(const DemoHost&) = delete;
  DemoHost& operator=(const DemoHost&) = delete;

  // Shows the form, logs on and lists the account.
  bool Open();
  int RunUntilClosed();

  const std::wstring& Given(Input which) const { return arguments_[which]; }
  ListPane& List() { return list_; }
  ThumbnailPane& Thumbnails() { return thumbnails_; }
  // The one that the commands act on.
  FilePane& Used() { return *used_; }
  HWND Frame() const { return frame_; }
  HWND OpenedPicture() const { return picture_.Window(); }

  // Logs the user on, after which the library asks the service for his files anew, and lists them.
  bool LogOn();
  // Lists the account in both controls.
  bool Fill();
  void Do(int command);
  bool Upload(const std::wstring& path);
  // The path of the file; empty when it failed.
  std::wstring Download();

  void Log(const std::wstring& line);
  std::wstring Status() const;
  // Percent, as the progress bar shows.
  int Progress() const;
  // Called when the progress bar has moved; may be empty.
  std::function<void()> onProgress;

  // Lets the windows live for a while.
  void Rest(DWORD milliseconds);

 private:
  static LRESULT CALLBACK FrameProc(HWND window, UINT message, WPARAM wParam, LPARAM lParam);
  void Handle(MSG& message);
  void Pump();
  int Scaled(int at96) const { return MulDiv(at96, dpi_, 96); }
  bool MakeWindows();
  void Layout();
  // The system's colors have changed.
  void TakeColors();
  bool MakeControls();
  FilePane& Other(const FilePane& pane);
  // Lists the account in that control. What one control changed the other one shows only after this.
  bool Show(FilePane& pane);
  void Use(FilePane& pane);
  // Checks the button of the filter in use; one that was pressed and refused checks itself.
  void ShowFilter();
  void ChangeFilter(int command);
  void ChooseUpload();
  // Why the file was not uploaded; empty when it was.
  std::wstring UploadOne(FilePane& pane, const std::wstring& path);
  // As long as a command or a page of pictures is under way, they wait for its end.
  void UploadDropped();
  void OpenPicture();
  void Delete();
  void Stop();
  void ShowMenu(POINT at);
  // A command is under way from here on; `size` is what the progress events count to, 0 without any.
  void BeginWork(int size);
  // Its end. Without `failure` it is well.
  void EndWork(const std::wstring& outcome, const std::wstring& failure);
  void UpdateStop();
  void SetStatus(const std::wstring& text, bool isError = false);
  void OnEvent(FilePane& pane, DISPID event, const std::vector<VARIANT>& arguments);
  void OnFileManagerEvent(FilePane& pane, int code, const std::wstring& text);

  const std::vector<std::wstring> arguments_;
  std::FILE* log_ = nullptr;
  int dpi_ = 96;
  FontOwner font_;
  HWND frame_ = nullptr;
  HWND site_ = nullptr;
  HWND progress_ = nullptr;
  HWND status_ = nullptr;
  HWND events_ = nullptr;
  std::vector<HWND> buttons_;
  ListPane list_;
  ThumbnailPane thumbnails_;
  FilePane* used_ = &list_;
  PictureWindow picture_;
  // The command of the one in use.
  int filter_ = kAll;
  bool isError_ = false;
  // A command or a page of pictures is under way, which Stop ends.
  bool working_ = false;
  bool fetching_ = false;
  int workSize_ = 0;
  // Paths of files that were dropped on a control and are not uploaded yet.
  std::vector<std::wstring> dropped_;
  // A click in the list has begun.
  bool listClicked_ = false;
};

}  // namespace tarnwick::demo
