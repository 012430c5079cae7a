// Names, files and folders. Names are split and compared exactly; nothing is trimmed.
#pragma once

#include "base/Text.h"

namespace tarnwick {

class FileSystem;

// Everything after the last "/" or "\"; the whole text when it holds none. They point into the argument.
TextView FileNameFromUrl(TextView url);
TextView FileNameFromPath(TextView path);

// Length in bytes as a signed 32-bit number, so that files from 2 GiB on wrap. Throws 53 when there is none.
double GetLocalFileSize(FileSystem& files, TextView path);

// Time of the last change in the user's date and time format. Throws 53 when there is no file.
Text GetLocalFileDate(FileSystem& files, TextView path);

// Copies over an existing destination; every failure is ignored.
void CopyLocalFile(FileSystem& files, TextView source, TextView destination);

// Whether a name matches `path`, which may hold wildcards. FolderExists is true for a file too.
bool FileExists(FileSystem& files, TextView path);
bool FolderExists(FileSystem& files, TextView path);

// Creates one level; always returns false. Throws 58 when the name is taken, 75 or 76 on other failures.
bool CreateFolder(FileSystem& files, TextView path);

// The system's temporary folder, with its trailing separator.
Text GetTempFolder(FileSystem& files);

// Folder name of a hosting user: dots after the first "@" become dashes, all dots when there is no "@".
Text UserFolderName(TextView userName);

}  // namespace tarnwick
