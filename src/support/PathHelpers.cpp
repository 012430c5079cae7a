#include "support/PathHelpers.h"

#include <cstdint>

#include "base/RuntimeError.h"
#include "platform/FileSystem.h"

namespace tarnwick {
namespace {

TextView AfterLast(TextView text, char16_t separator) {
  // rfind answers npos when there is none, and npos + 1 is 0: the whole text.
  return text.substr(text.rfind(separator) + 1);
}

}  // namespace

TextView FileNameFromUrl(TextView url) {
  return AfterLast(url, u'/');
}

TextView FileNameFromPath(TextView path) {
  return AfterLast(path, u'\\');
}

double GetLocalFileSize(FileSystem& files, TextView path) {
  return static_cast<std::int32_t>(static_cast<std::uint32_t>(files.Length(path)));
}

Text GetLocalFileDate(FileSystem& files, TextView path) {
  return files.ModifiedText(path);
}

void CopyLocalFile(FileSystem& files, TextView source, TextView destination) {
  ResultAsItStood(0, [&](int&) { files.Copy(source, destination); });
}

bool FileExists(FileSystem& files, TextView path) {
  return files.Exists(path, false);
}

bool FolderExists(FileSystem& files, TextView path) {
  return files.Exists(path, true);
}

bool CreateFolder(FileSystem& files, TextView path) {
  files.MakeFolder(path);
  return false;
}

Text GetTempFolder(FileSystem& files) {
  return files.TempPath();
}

Text UserFolderName(TextView userName) {
  const std::size_t afterAt = userName.find(u'@') + 1;
  return Text(userName.substr(0, afterAt)) + ReplaceAll(userName.substr(afterAt), u".", u"-");
}

}  // namespace tarnwick
