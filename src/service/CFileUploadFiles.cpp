// The operations on the files of the account.
#include <algorithm>
#include <memory>
#include <optional>

#include "base/RuntimeError.h"
#include "platform/FileSystem.h"
#include "platform/HttpTransport.h"
#include "platform/Internet.h"
#include "service/CFileUpload.h"
#include "support/HttpAddress.h"
#include "support/PathHelpers.h"

namespace tarnwick {
namespace {

// As many as an upload may have.
constexpr std::uint64_t kMostFileBytes = 0xFFFF'FFFF;

// Records that share a block of memory: one for each would take much of a listing's time.
constexpr std::size_t kBlockFiles = 64;

// Makes a file a normal one as long as the object lives. Where that is not allowed, as on a medium that
// cannot be written, the file stays as it is.
class NormalAttributes {
 public:
  NormalAttributes(FileSystem& files, TextView path)
      : files_(files), path_(path), saved_(files.Attributes(path)) {
    if (saved_ == 0) return;
    cleared_ = ResultAsItStood(false, [&](bool& cleared) {
      files_.SetAttributes(path_, 0);
      cleared = true;
    });
  }
  ~NormalAttributes() {
    if (!cleared_) return;
    ResultAsItStood(0, [&](int&) { files_.SetAttributes(path_, saved_); });
  }
  NormalAttributes(const NormalAttributes&) = delete;
  NormalAttributes& operator=(const NormalAttributes&) = delete;

 private:
  FileSystem& files_;
  const Text path_;
  const std::uint32_t saved_;
  bool cleared_ = false;
};

std::string_view ElementAt(const Reply::Values& values, std::size_t index) {
  if (index >= values.size()) throw RuntimeError(error::kSubscriptOutOfRange);
  return values[index];
}

}  // namespace

bool CFileUpload::ListFilesForUser(const FileSink& colFiles) {
  return ResultAsItStood(false, [&](bool& listed) {
    if (ListIsCurrent()) {
      listed = true;
      return;
    }
    const Reply reply = Ask(u"ListFilesRequest", u"ListFiles",
                            {{u"Username", SessionUser()}, {u"ProductID", SessionProduct()}}, 1);
    if (reply.ErrorOccured() == 1) return;
    const Reply::Values* names = reply.GetValueByVariableName(u"FileName");
    const Reply::Values* urls = reply.GetValueByVariableName(u"FileURL");
    const Reply::Values* sizes = reply.GetValueByVariableName(u"FileSize");
    const Reply::Values* dates = reply.GetValueByVariableName(u"FileDate");
    // An account without files has them all, empty.
    if (!names || !urls || !sizes || !dates) return;
    std::shared_ptr<CUpload[]> block;
    for (std::size_t i = 0; i < names->size(); ++i) {
      const std::size_t inBlock = i % kBlockFiles;
      if (inBlock == 0) block = std::make_shared<CUpload[]>(std::min(kBlockFiles, names->size() - i));
      const std::shared_ptr<CUpload> file(block, block.get() + inBlock);
      file->FileName = reply.Shared((*names)[i]);
      file->FilePath = reply.Shared(ElementAt(*urls, i));
      file->FileDate = reply.Shared(ElementAt(*dates, i));
      file->FileSize = LeadingNumber(ElementAt(*sizes, i));
      colFiles(file);
    }
    listed = true;
  });
}

Text CFileUpload::UploadFile(TextView szFilePath) {
  return RegisterFile(FileNameFromUrl(szFilePath), szFilePath);
}

Text CFileUpload::SaveUploadFile(TextView szFilePath) {
  return RegisterFile(FileNameFromPath(szFilePath), szFilePath);
}

Text CFileUpload::RegisterFile(TextView fileName, TextView path) {
  return ResultAsItStood(Text(), [&](Text& url) {
    FileSystem& files = apartment_.platform.files;
    const double size = GetLocalFileSize(files, path);
    SetCUploadObject(fileName, path, size);
    const NormalAttributes meanwhile(files, path);
    url = AskForText(u"FileUploadRequest", u"FileUpload",
                     {{u"FileName", EnCodeString(fileName)},
                      {u"FileSize", TextFromNumber(static_cast<std::int64_t>(size))},
                      {u"Username", SessionUser()},
                      {u"ProductID", SessionProduct()}},
                     1, u"FileURL", u"");
  });
}

void CFileUpload::SetCUploadObject(TextView FileName, TextView FilePath, double FileSize) {
  ResultAsItStood(0, [&](int&) {
    CUpload& record = *GetUploadObject();
    record.FileName = FileName;
    record.FilePath = FilePath;
    record.FileSize = FileSize;
  });
}

std::int32_t CFileUpload::RenameFile(TextView ProductID, TextView Username, TextView FileToRename,
                                     TextView NewFileName) {
  return ResultAsItStood(status::kRenameRefused, [&](std::int32_t& result) {
    const std::int32_t answer = AskForNumber(u"RenameFileRequest", u"RenameFile",
                                             {{u"Username", Text(Username)},
                                              {u"ProductID", Text(ProductID)},
                                              {u"OldFileName", EnCodeString(FileToRename)},
                                              {u"NewFileName", EnCodeString(NewFileName)}},
                                             1, u"lRenameFileStatus", status::kRenameRefused);
    if (answer == status::kSuccess) result = answer;
  });
}

std::int32_t CFileUpload::DeleteFileForUser(TextView FileToBeDeleted) {
  return ResultAsItStood(std::int32_t{0}, [&](std::int32_t& result) {
    const Reply reply = Ask(u"DeleteFileRequest", u"DeleteFile",
                            {{u"Username", SessionUser()},
                             {u"ProductID", SessionProduct()},
                             {u"FileToBeDeleted", EnCodeString(FileToBeDeleted)}},
                            1);
    if (reply.ErrorOccured() == 1) {
      result = status::kFailure;
    } else if (BooleanFromText(reply.First(u"DeleteStatus"))) {
      result = status::kSuccess;
    }
  });
}

double CFileUpload::GetMaxQuota(TextView ProductID, TextView Username) {
  return ResultAsItStood(0.0, [&](double& quota) {
    quota = LeadingNumber(AskForText(u"GetMaxQuota", u"GetMaxUserQuota",
                                     {{u"ProductID", Text(ProductID)}, {u"UserName", EnCodeString(Username)}},
                                     0, u"MaxUserQuota", u""));
  });
}

std::optional<double> CFileUpload::GetTotalUsedQuota(TextView ProductID, TextView Username) {
  return ResultAsItStood(std::optional<double>(), [&](std::optional<double>& used) {
    const Reply reply = Ask(u"GetTotalUsedQuota", u"GetTotalUsedQuota",
                            {{u"ProductID", Text(ProductID)}, {u"UserName", EnCodeString(Username)}}, 0);
    if (reply.ErrorOccured() != 1) used = LeadingNumber(reply.First(u"UsedQuota"));
  });
}

std::int32_t CFileUpload::CanUploadFile() {
  return ResultAsItStood(std::int32_t{0}, [&](std::int32_t& number) {
    number = AskForNumber(u"CanUploadFile", u"CanUploadFile",
                          {{u"UserName", SessionUser()}, {u"ProductID", SessionProduct()}}, 0,
                          u"CanUploadFile", status::kFailure);
  });
}

bool CFileUpload::FileExists(TextView szNewFileName) const {
  return apartment_.listing.all.PositionWhere(
             [&](const CUpload& file) { return file.FileName == szNewFileName; }) != 0;
}

void CFileUpload::AbortFileTransfer(bool bAbortStatus) {
  apartment_.abortTransfer = bAbortStatus;
  if (bAbortStatus) ++apartment_.aborts;
}

bool CFileUpload::FetchSecurely(TextView serverFile, TextView localFile) {
  // A file of the folder, and of no other one.
  if (serverFile.empty() || serverFile == u"." || serverFile == u".." ||
      serverFile.find_first_of(u"/\\") != TextView::npos)
    return false;
  const auto address = SplitUrl(apartment_.ftp.secureFolder);
  if (!address || !address->secure) return false;
  HttpGet get;
  get.host = address->host;
  get.port = address->port;
  get.target = EscapeUnprintable(address->path) + "/" + EscapeFormValue(serverFile);
  const std::unique_ptr<FileWriter> writer = apartment_.platform.files.Create(localFile);
  const auto status = apartment_.platform.http.Get(get, kMostFileBytes, [&](std::string_view bytes) {
    return ResultAsItStood(false, [&](bool& written) {
      writer->Write(bytes);
      written = true;
    });
  });
  if (status != 200) return false;
  writer->Commit();
  return true;
}

Text CFileUpload::DownloadFile(TextView szServerFileName, TextView szLocalFileName) {
  return ResultAsItStood(Text(), [&](Text& local) {
    if (!apartment_.ftp.secureFolder.empty()) {
      if (FetchSecurely(szServerFileName, szLocalFileName)) local = szLocalFileName;
      return;
    }
    FtpConnection* connection = apartment_.ftp.connection.get();
    // One of an earlier session may be open still.
    if (apartment_.session.IsSecure() || !connection || !connection->Directory()) return;
    if (connection->GetFile(szServerFileName, szLocalFileName)) local = szLocalFileName;
  });
}

}  // namespace tarnwick
