' Lists the files of an account. Run it with
'   cscript //nologo client.vbs SERVER USER PASSWORD PRODUCT
Set arguments = WScript.Arguments
Set client = CreateObject("Tarnwick.CFileUpload")
If Not client.ConnectToServer(arguments(0)) Then
  WScript.Echo "There is no service at " & arguments(0)
  WScript.Quit 1
End If
If Not client.LogonAs(arguments(3), arguments(1), arguments(2), "") Then
  WScript.Echo "The service does not know this user or password"
  WScript.Quit 1
End If

' A collection of the host's own would do as well; with nothing the library makes one.
Set files = Nothing
If Not client.ListFilesForUser(files) Then
  WScript.Echo "The files could not be listed"
  WScript.Quit 1
End If
For Each file In files
  WScript.Echo file.FileName & ", " & file.FileSize & " bytes, " & file.FilePath
Next
WScript.Echo files.Count & " files, " & client.GetTotalUsedQuota(arguments(3), arguments(1)) & " of " & _
  client.GetMaxQuota(arguments(3), arguments(1)) & " bytes used"
