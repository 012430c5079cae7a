// The components that move bytes, as the controls use them, and what they tell meanwhile.
#pragma once

#include <cstdint>
#include <string_view>

#include "base/Text.h"

namespace tarnwick {

// What an upload tells while it runs. In all but FileBytes and IsWanted the host's code may run, which may
// call the control again and pump messages.
class UploadEvents {
 public:
  virtual ~UploadEvents() = default;
  virtual void ActionComplete() = 0;
  virtual void Connecting() = 0;
  virtual void Initializing() = 0;
  virtual void ServerProcess() = 0;
  virtual void UploadStarted() = 0;
  // The next bytes of the file as they were read, which will be sent. Must not throw.
  virtual void FileBytes(std::string_view bytes) = 0;
  virtual void UploadProgress(std::int32_t percent, std::int32_t bytes) = 0;
  virtual void UploadComplete() = 0;
  // Whether the upload is to go on. One that is not wanted any more before its last byte has left puts no
  // file on the server.
  virtual bool IsWanted() const = 0;
};

// The three operations throw a RuntimeError with the component's number. UploadFile pumps messages, the
// others block without doing so.
class Uploader {
 public:
  virtual ~Uploader() = default;
  virtual void UploadFile(TextView localPath, TextView usersBaseUrl, TextView acceptorPath, std::int32_t flag,
                          TextView user, TextView password, TextView productGuid, UploadEvents& events) = 0;
  virtual void DeleteFile(TextView usersBaseUrl, TextView name, TextView acceptorPath, TextView user,
                          TextView password, TextView productGuid) = 0;
  virtual void RenameFile(TextView usersBaseUrl, TextView oldName, TextView newName, TextView acceptorPath,
                          TextView user, TextView password, TextView productGuid) = 0;
};

// What a download tells, from messages that are handled in Downloader::Wait, or in any other loop of the
// thread. The host's code may run in all but IsWanted.
class DownloadEvents {
 public:
  virtual ~DownloadEvents() = default;
  virtual void Resolving() = 0;
  virtual void Connected() = 0;
  virtual void TransferStarting() = 0;
  // The header of the reply is whole: its first line, and the bytes of the file so far.
  virtual void HeaderFound(TextView statusLine, std::int32_t bytes) = 0;
  // Bytes so far.
  virtual void Received(std::int32_t bytes) = 0;
  // Closed by the peer, and the file writer has run. `written`: the explicit target is there, or, without
  // one, the file in the user's folder.
  virtual void Finished(bool written) = 0;
  // There is no file. `told`: the host is to be notified by 5555, which a time-out does not do.
  virtual void Failed(std::int32_t ftpError, TextView description, bool told) = 0;
  // Whether the download is to go on. One that is not wanted any more is cancelled before it does anything
  // else.
  virtual bool IsWanted() const = 0;
};

class Downloader {
 public:
  virtual ~Downloader() = default;
  // Whether a download of `url` can be attempted; otherwise Start fails at once.
  virtual bool CanStart(TextView url) const = 0;
  // Begins to make the file for the Start that follows with this target; the caller may do something slow
  // meanwhile. Cancel drops it. Not while a download runs.
  virtual void Prepare(TextView target) = 0;
  // Begins to fetch the file at `url` into the user's folder, and to `explicitTarget` first unless that is
  // empty; ends a download that runs. Raises events, also the one of a failure, before it returns.
  virtual void Start(TextView url, TextView explicitTarget) = 0;
  // Null: from here on nobody is told.
  virtual void SetEvents(DownloadEvents* events) = 0;
  // Ends a download without an event.
  virtual void Cancel() = 0;
  // The watchdog fails the transfer that runs, a download or an upload, unless it is started again in time.
  virtual void RestartWatchdog() = 0;
  virtual void StopWatchdog() = 0;
  // Sleeps until there is a message, and pumps what waits then. In it the downloader tells its events.
  virtual void Wait() = 0;
};

}  // namespace tarnwick
