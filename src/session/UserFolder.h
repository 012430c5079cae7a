#pragma once

namespace tarnwick {

struct Apartment;

// Creates the logged-on user's working folder under the temporary folder, reads the proxy settings and then
// sets UserFolderPath. On any failure, one of the proxy settings included, it ends silently and
// UserFolderPath keeps its value. A folder that is there already is fine.
void PrepareUserFolder(Apartment& apartment) noexcept;

}  // namespace tarnwick
