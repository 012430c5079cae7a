// The form with both controls, and the commands of its tool bar, which act on the control that is shown.
#pragma once

#include "FilePane.h"

#include <cstdio>
#include <string>
#include <vector>

namespace tarnwick::demo {

enum Command : int { kUpload = 100, kDelete, kRename, kDownload, kAll, kGif, kJpg, kSwitch };

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
  FilePane& Shown() { return *shown_; }

  // Logs the user on, after which the library asks the service for his files anew, and lists them.
  bool LogOn();
  bool Fill();
  void Do(int command);
  bool Upload(const std::wstring& path);
  std::wstring Download();

  void Log(const std::wstring& line);
  std::wstring Status() const;
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
  bool MakeControls();
  void Show(FilePane& pane);
  void ChangeFilter(const wchar_t* filter);
  void SetStatus(const std::wstring& text);
  void OnEvent(DISPID event, const std::vector<VARIANT>& arguments);

  const std::vector<std::wstring> arguments_;
  std::FILE* log_ = nullptr;
  int dpi_ = 96;
  HWND frame_ = nullptr;
  HWND site_ = nullptr;
  HWND progress_ = nullptr;
  HWND status_ = nullptr;
  HWND events_ = nullptr;
  std::vector<HWND> buttons_;
  ListPane list_;
  ThumbnailPane thumbnails_;
  FilePane* shown_ = &list_;
  std::wstring filter_ = L"*";
};

}  // namespace tarnwick::demo
