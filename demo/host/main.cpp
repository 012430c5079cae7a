// A host program with both controls side by side on its form: a tool bar and a menu for what can be done, a
// progress bar that their events drive, a line that says what happened or why not, and an event log.
//
//   tarnwick-demo SERVER USER PASSWORD PRODUCT PICTURES DOWNLOADS LOG [SHOTS]
//
// With SHOTS, a folder, it runs through a tour and, after each step, waits for a file STEP.png to appear
// there, which somebody takes of the screen. Without, it stays open for the user.
#include "DemoHost.h"
#include "Tour.h"

#include <shellapi.h>

int WINAPI wWinMain(HINSTANCE, HINSTANCE, LPWSTR, int) {
  using tarnwick::demo::DemoHost;
  int count = 0;
  LPWSTR* words = CommandLineToArgvW(GetCommandLineW(), &count);
  std::vector<std::wstring> arguments(words + 1, words + count);
  LocalFree(words);
  if (arguments.size() <= DemoHost::kLog) return 2;
  // Else Windows draws for 96 dots per inch and enlarges that.
  SetProcessDPIAware();
  OleInitialize(nullptr);
  int result = 1;
  {
    const bool tours = arguments.size() > DemoHost::kShots;
    DemoHost host(std::move(arguments));
    if (host.Open()) {
      if (tours)
        result = tarnwick::demo::Tour(host).Run() ? 0 : 1;
      else
        result = host.RunUntilClosed();
    }
  }
  OleUninitialize();
  return result;
}
