' A host to be killed. Logs on, lists, downloads a small picture, says "ready", and then transfers until it is ended.
' Arguments: SERVER USER PASSWORD PRODUCT KIND DOWNLOADS PICTURE
Option Explicit
Dim arguments, list, view, client
Set arguments = WScript.Arguments
Set list = CreateObject("Tarnwick.ctrlListImage")
Set view = CreateObject("Tarnwick.ctrlThumbNailView")
Set client = list.mobjFileupload

If Not client.ConnectToServer(arguments(0)) Then WScript.Quit 1
If Not client.LogonAs(arguments(3), arguments(1), arguments(2), "") Then WScript.Quit 1
list.Init "*"
Download "small.jpg"
WScript.Echo "ready"
Do
  Select Case arguments(4)
    Case "upload"
      list.UploadImage arguments(6)
    Case "download"
      Download "large.jpg"
    Case "thumbnails"
      view.Init "*"
  End Select
Loop

Sub Download(name)
  list.UploadedFileSetFocus name
  list.DownLoadFileFromServer arguments(5)
End Sub
