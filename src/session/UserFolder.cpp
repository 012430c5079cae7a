#include "session/UserFolder.h"

#include "base/RuntimeError.h"
#include "platform/FileSystem.h"
#include "session/Apartment.h"
#include "session/ProxySettings.h"
#include "support/PathHelpers.h"

namespace tarnwick {
namespace {

void EnsureFolder(FileSystem& files, const Text& path) {
  if (FolderExists(files, path)) return;
  try {
    CreateFolder(files, path);
  } catch (const RuntimeError& failure) {
    // Another program may have created it since we looked, or it is hidden.
    if (failure.Number() != error::kFileAlreadyExists) throw;
  }
}

}  // namespace

void PrepareUserFolder(Apartment& apartment) noexcept {
  ResultAsItStood(0, [&](int&) {
    FileSystem& files = apartment.platform.files;
    Text path = GetTempFolder(files);
    // Without one the folder would come to lie in the root of whatever drive is current.
    if (path.empty()) return;
    if (path.ends_with(u'\\')) path.pop_back();
    path += u"\\bv";
    EnsureFolder(files, path);
    path += u"\\" + UserFolderName(apartment.session.userName);
    EnsureFolder(files, path);
    files.RemoveLeftovers(path);
    // The proxy comes before the assignment: without readable proxy settings there is no user folder.
    apartment.proxy.ProxyHost = GetProxySettings(apartment);
    apartment.UserFolderPath = path;
  });
}

}  // namespace tarnwick
