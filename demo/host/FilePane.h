// One of the two controls on the host's form. What both can do the host calls here, so that its commands act
// on whichever was used last.
#pragma once

#include "ControlContainer.h"
#include "surface/TypeLibrary.h"

#include "Argument.h"

namespace tarnwick::demo {

class FilePane {
 public:
  using EventHandler = std::function<void(DISPID event, std::vector<VARIANT>& arguments)>;

  FilePane() = default;
  virtual ~FilePane() = default;
  FilePane(const FilePane&) = delete;
  FilePane& operator=(const FilePane&) = delete;

  // Called when the user turns to the control; may be empty.
  std::function<void()> onUse;

  // Puts the control into `window`, hidden.
  virtual bool Create(HWND window, HFONT font, const EventHandler& onEvent) = 0;
  // The service client that the control works with.
  virtual ComPtr<_CFileUpload> Client() const = 0;
  virtual void UseClient(_CFileUpload* client) = 0;
  // Lists the account.
  virtual bool Init(const std::wstring& filter) = 0;
  virtual void ChangeFilter(const std::wstring& filter) = 0;
  virtual bool Upload(const std::wstring& path) = 0;
  // Of the selected file; the path that it was written to.
  virtual std::wstring Download(const std::wstring& folder) = 0;
  virtual void Delete() = 0;
  virtual void StartRename() = 0;
  // Whether there is a file of that name to select.
  virtual bool Select(const std::wstring& name) = 0;
  virtual std::wstring Selected() const = 0;
  virtual int SelectedCount() const = 0;
  // Bytes of the selected file, as the listing tells.
  virtual int SelectedSize() const = 0;
  // Why the operation that ended last failed; empty when it did not.
  virtual std::wstring Problem() const = 0;
  // Gives the control the keyboard.
  virtual void Focus() = 0;

  void Show() { container_->Do(OLEIVERB_SHOW); }
  // Of the controls on a form one is active; the form says so to the one that was.
  void Deactivate();
  void SetBounds(const RECT& bounds) {
    if (container_) container_->SetBounds(bounds);
  }
  // The system's colors, which the form offers its controls, have changed.
  void TakeColors() {
    if (container_) container_->AmbientChanged(DISPID_UNKNOWN);
  }
  bool TranslateKey(MSG& message) { return container_ && container_->TranslateKey(message); }
  void Close() {
    if (container_) container_->Close();
  }
  // The control's window; null before there is one, and when the control is closed.
  HWND Window() const;

 protected:
  bool CreateControl(HWND window, HFONT font, REFCLSID classId, const EventHandler& onEvent);
  // Null before there is one, and when it is closed.
  IUnknown* Control() const { return container_ ? container_->Control() : nullptr; }
  // Of the first file in a collection that a control made.
  static double SizeIn(IDispatch& files);

 private:
  ComPtr<ControlContainer> container_;
};

// The members that the interfaces of both controls have.
template <typename Interface>
class FilePaneOf : public FilePane {
 public:
  bool Create(HWND window, HFONT font, const EventHandler& onEvent) override {
    return CreateControl(window, font, ClassId(), onEvent) &&
           SUCCEEDED(Control()->QueryInterface(__uuidof(Interface), control_.ReceiveVoid()));
  }
  ComPtr<_CFileUpload> Client() const override {
    ComPtr<_CFileUpload> client;
    control_->get_mobjFileupload(client.Receive());
    return client;
  }
  void UseClient(_CFileUpload* client) override { control_->putref_mobjFileupload(client); }
  bool Init(const std::wstring& filter) override {
    Argument text(filter);
    VARIANT_BOOL done = VARIANT_FALSE;
    VARIANT_BOOL on = VARIANT_TRUE;
    VARIANT ignored = {};
    control_->EnableRename(&on, &ignored);
    return SUCCEEDED(control_->Init(text.Reference(), &done)) && done;
  }
  void ChangeFilter(const std::wstring& filter) override {
    control_->ChangeFileFilter(Argument(filter).Get());
  }
  bool Upload(const std::wstring& path) override {
    VARIANT_BOOL done = VARIANT_FALSE;
    control_->UploadImage(Argument(path).Get(), &done);
    return done;
  }
  std::wstring Download(const std::wstring& folder) override {
    BSTR local = nullptr;
    control_->DownLoadFileFromServer(Argument(folder).Get(), &local);
    return Taken(local);
  }
  void Delete() override { control_->DeleteFile(); }
  bool Select(const std::wstring& name) override {
    Argument text(name);
    VARIANT ignored = {};
    control_->UploadedFileSetFocus(text.Reference(), &ignored);
    return Selected() == name;
  }
  std::wstring Selected() const override {
    BSTR name = nullptr;
    control_->SelectedFileName(&name);
    return Taken(name);
  }
  int SelectedSize() const override {
    Variant address;
    Variant ignored;
    ComPtr<IDispatch> files;
    control_->GetSelectedFilesHttpPath(&address.Get());
    control_->GetFileDetails(address.Get(), files.Receive(), &ignored.Get());
    return files ? static_cast<int>(SizeIn(*files)) : 0;
  }
  std::wstring Problem() const override {
    FtpErrors error = ERROR_FTP_WINSOCK_Success;
    BSTR words = nullptr;
    control_->get_m_LastError(&error);
    if (error == ERROR_FTP_WINSOCK_Success) return L"";
    control_->get_m_strLastErrorDesc(&words);
    return Taken(words);
  }

 protected:
  virtual REFCLSID ClassId() const = 0;

  ComPtr<Interface> control_;
};

class ListPane final : public FilePaneOf<_ctrlListImage> {
 public:
  bool Init(const std::wstring& filter) override;
  void Delete() override;
  void StartRename() override;
  int SelectedCount() const override;
  void Focus() override;
  int Count() const;
  HWND ListWindow() const;
  // Makes the columns as wide as there is room. Init makes them narrow.
  void SpreadColumns();

 private:
  REFCLSID ClassId() const override { return CLSID_ctrlListImage; }
};

class ThumbnailPane final : public FilePaneOf<_ctrlThumbNailView> {
 public:
  void StartRename() override;
  int SelectedCount() const override { return Selected().empty() ? 0 : 1; }
  void Focus() override;
  // Whether that window inside the control is one of its pictures.
  bool IsPicture(HWND window) const;

 private:
  REFCLSID ClassId() const override { return CLSID_ctrlThumbNailView; }
};

}  // namespace tarnwick::demo
