' Walks through a picture account by way of Tarnwick.CFileUpload and prints each operation with its result.
'
'   cscript //nologo account.vbs SERVER USER PASSWORD PRODUCT MGUID PICTURES [DOWNLOADS]
'
'   SERVER     of the service, as host or host:port
'   USER       name of an account that holds pictures
'   PASSWORD   of that account
'   PRODUCT    product number, for example 7
'   MGUID      of that account; - asks the service for it
'   PICTURES   local folder with the pictures that the account holds, to register one of them
'   DOWNLOADS  local folder to fetch a picture into over FTP; without it the FTP part is skipped, since not
'              every service has an FTP server
'
' Ends with 0 when all went as expected, else with 1. It leaves the account as it found it, but for one picture
' that it deletes as long as the account holds more than three.
Option Explicit

Const DONE = 1001
Const TAKEN = "1003"
Const MISSING_NAME = "no such picture.jpg"

If WScript.Arguments.Count < 6 Then
  WScript.Echo "Usage: account.vbs SERVER USER PASSWORD PRODUCT MGUID PICTURES [DOWNLOADS]"
  WScript.Quit 1
End If

Dim server, user, password, product, mguid, pictures, downloads
server = WScript.Arguments.Item(0)
user = WScript.Arguments.Item(1)
password = WScript.Arguments.Item(2)
product = WScript.Arguments.Item(3)
mguid = WScript.Arguments.Item(4)
pictures = WScript.Arguments.Item(5)
downloads = ""
If WScript.Arguments.Count > 6 Then downloads = WScript.Arguments.Item(6)

Dim operations, failures, client
operations = 0
failures = ""
' A script host may end with 0 after a run-time error, so the walk's own are caught here.
On Error Resume Next
Walk
If Err.Number <> 0 Then
  failures = failures & vbCrLf & "  The walk ended early with error " & Err.Number & ": " & Err.Description
End If
On Error GoTo 0

WScript.Echo ""
If failures = "" Then
  WScript.Echo "All " & operations & " operations went as expected."
  WScript.Quit 0
End If
WScript.Echo "Not as expected:" & failures
WScript.Quit 1

Sub Walk()
  WScript.Echo "Status codes: 1001 done, 1002 no, 1003 user exists or unknown, 1033 not renamed, 0 not done."
  Set client = CreateObject("Tarnwick.CFileUpload")
  LogOn
  If failures <> "" Then Exit Sub
  ShowFiles
  ShowAccount
  RegisterPicture
  RenamePicture
  DeletePicture
  FetchPicture
  SecondAccount
  client.DisconnectFromServer
End Sub

' --- The parts of the walk ----------------------------------------------------------------------------------

Sub LogOn()
  Headline "Log-on"
  Report "Connect to " & server, client.ConnectToServer(server), True
  Report "Log on with a wrong password", client.LogonAs(product, user, password & "x", "{}"), False
  If mguid = "-" Then mguid = client.GetMGUIDForUser(product, user)
  Report "Log on as " & user, client.LogonAs(product, user, password, mguid), True
  If failures <> "" Then Exit Sub
  Tell "Folder on the server", client.GetFileUploadPath()
  Tell "Web address of the folder", client.GetUserBasePath()
  Tell "Time at the server", client.GetCurrentDateTimeFromServer()
End Sub

Sub ShowFiles()
  Dim files, file, total, width
  Set files = ListFiles()
  Headline "Files"
  width = Len("Name")
  For Each file In files
    If Len(file.FileName) > width Then width = Len(file.FileName)
  Next
  WScript.Echo "  " & PadRight("Name", width) & PadLeft("Bytes", 12) & "  Date"
  total = 0
  For Each file In files
    WScript.Echo "  " & PadRight(file.FileName, width) & PadLeft(Grouped(file.FileSize), 12) & _
      "  " & file.FileDate
    total = total + file.FileSize
  Next
  WScript.Echo "  " & PadRight(files.Count & " files", width) & PadLeft(Grouped(total), 12)
  Report "The account holds pictures", files.Count > 0, True
End Sub

Sub ShowAccount()
  Dim accounts, account, most, used
  Headline "Account"
  Set accounts = Nothing
  Report "Ask for the account's details", _
    client.GetAccountDetailsForMGUID(mguid, user, product, accounts), DONE
  If Not accounts Is Nothing Then
    Report "Accounts of that name", accounts.Count, 1
    For Each account In accounts
      Tell "Mail address", account.EmailAddress
      Tell "Service level", account.ServiceLevelName
      Tell "Started", account.StartDate
      Tell "Expires after", account.ExpiryPeriod & " days"
      Tell "Today at the server", account.CurrentDate
      Tell "Quota and its use, as the account says", _
        Grouped(account.Quota) & " and " & Grouped(account.UsedQuota)
    Next
  End If
  most = client.GetMaxQuota(product, user)
  used = client.GetTotalUsedQuota(product, user)
  Report "The account has a quota", most > 0, True
  Report "The service tells how much is used", Not IsEmpty(used), True
  Tell "Quota", PadLeft(Grouped(most), 12) & " bytes"
  Tell "Used", PadLeft(Grouped(used), 12) & " bytes"
  Tell "Free", PadLeft(Grouped(most - used), 12) & " bytes"
  Report "May upload", client.CanUploadFile(), DONE
  Report "Has not expired", client.HasUserAccountExpired(user), DONE
  Tell "Created", client.GetCreationDateForMGUID(product, user)
  Tell "Premium accounts start with", Grouped(client.GetPremiumBaseAccountSize(user)) & " bytes"
  Tell "Accounts: warning from, most", client.GetSoftLimit(product) & ", " & client.GetHardLimit(product)
  Report "Mail the key to the user", client.EmailKeyToUser(product, user), DONE
End Sub

' The service answers the address under which a registered picture is seen.
Sub RegisterPicture()
  Dim files, file, address
  Headline "Register, rename, delete"
  Set files = ListFiles()
  For Each file In files
    address = client.SaveUploadFile(pictures & "\" & file.FileName)
    If address <> "" Then
      Report "Register " & file.FileName, address, file.FilePath
      Report "The record in hand", client.UploadObject.FileName, file.FileName
      Exit Sub
    End If
  Next
  Report "A picture of the account lies in " & pictures, False, True
End Sub

Sub RenamePicture()
  Dim files, oldName, newName
  Set files = ListFiles()
  oldName = files.Item(1).FileName
  newName = "renamed " & oldName
  Do While Holds(files, newName)
    newName = "once more " & newName
  Loop
  Report "Rename " & oldName & " to " & newName, client.RenameFile(product, user, oldName, newName), DONE
  Set files = ListFiles()
  Report "The list shows the new name alone", Holds(files, newName) And Not Holds(files, oldName), True
  Report "Rename it back", client.RenameFile(product, user, newName, oldName), DONE
  Report "Rename what is not there", client.RenameFile(product, user, MISSING_NAME, newName), 1033
End Sub

Sub DeletePicture()
  Dim files, name, count
  Set files = ListFiles()
  count = files.Count
  If count > 3 Then
    name = files.Item(count).FileName
    Report "Delete " & name, client.DeleteFileForUser(name), DONE
    Set files = ListFiles()
    Report "Files left", files.Count, count - 1
    Report "The list shows it still", Holds(files, name), False
  Else
    Tell "Delete a picture", "skipped, there are only " & count
  End If
  Report "Delete what is not there", client.DeleteFileForUser(MISSING_NAME), 0
End Sub

Sub FetchPicture()
  Dim files, file, target, system
  Headline "FTP"
  If downloads = "" Then
    Tell "Fetch a picture", "skipped, no folder for downloads was given"
    Exit Sub
  End If
  Report "Open the session", client.OpenSession(), True
  Set files = ListFiles()
  For Each file In files
    ' Names go to the FTP server in the system's code page, so a plain one is taken.
    If IsPlain(file.FileName) Then
      target = downloads & "\" & file.FileName
      Report "Fetch " & file.FileName, client.DownloadFile(file.FileName, target), target
      Set system = CreateObject("Scripting.FileSystemObject")
      If system.FileExists(target) Then
        Report "Bytes in the local file", CDbl(system.GetFile(target).Size), file.FileSize
      Else
        Report "The local file is there", False, True
      End If
      Exit For
    End If
  Next
  Report "Fetch what is not there", client.DownloadFile(MISSING_NAME, downloads & "\" & MISSING_NAME), ""
  client.DisconnectFromServer
  Report "Fetch once disconnected", client.DownloadFile(MISSING_NAME, downloads & "\" & MISSING_NAME), ""
End Sub

Sub SecondAccount()
  Dim number, name, answer, key, changed
  Headline "A second account"
  number = 1
  Do
    name = "second" & number & "@demo.example"
    number = number + 1
  Loop While client.IsValidUserID(name, product)
  answer = client.AddUser(product, name, "")
  Report "Create " & name, Len(answer) > 4, True
  Tell "Its MGUID", answer
  Report "The service knows it", client.IsValidUserID(name, product), True
  Report "Create it again", client.AddUser(product, name, ""), TAKEN
  ' Creating the account logged the new user on.
  Report "It holds no files", ListFiles().Count, 0
  key = client.GetKeyForUser(product, name)
  Report "Its key was issued", Len(key) > 4, True
  changed = "Another-1"
  Report "Change its password", client.ManagePassword(product, name, key, changed), DONE
  Report "Log on with the old one", client.LogonAs(product, name, key, answer), False
  Report "Activate it again", Len(client.ActivateAccount(product, name, changed)) > 4, True
  Report "Remove it with a wrong password", client.DeleteUser(product, name, "wrong", True), 1002
  Report "Remove it", client.DeleteUser(product, name, changed, True), DONE
  Report "The service knows it still", client.IsValidUserID(name, product), False
  Report "Remove it again", client.DeleteUser(product, name, changed, True), 1003
  Report "Log on as " & user & " again", client.LogonAs(product, user, password, mguid), True
End Sub

' --- Help ---------------------------------------------------------------------------------------------------

' The account's files, in a collection that the library makes; an empty one after a failure.
Function ListFiles()
  Dim files
  Set files = Nothing
  Report "List the files", client.ListFilesForUser(files), True
  Set ListFiles = files
End Function

Function Holds(files, name)
  Dim file
  Holds = False
  For Each file In files
    If file.FileName = name Then Holds = True
  Next
End Function

Function IsPlain(text)
  Dim i
  IsPlain = True
  For i = 1 To Len(text)
    If InStr("abcdefghijklmnopqrstuvwxyz0123456789.-_", LCase(Mid(text, i, 1))) = 0 Then IsPlain = False
  Next
End Function

Sub Headline(text)
  WScript.Echo ""
  WScript.Echo text
End Sub

' Prints an operation with its result, and remembers it when that is not the one expected.
Sub Report(what, result, expected)
  operations = operations + 1
  If CStr(result) = CStr(expected) Then
    Tell what, result
  Else
    Tell what, result & "  <-- expected: " & expected
    failures = failures & vbCrLf & "  " & what & ": " & result
  End If
End Sub

Sub Tell(what, result)
  Dim shown
  shown = result
  If CStr(shown) = "" Then shown = "(nothing)"
  WScript.Echo "  " & PadRight(what, 52) & "  " & shown
End Sub

Function PadRight(text, width)
  PadRight = text
  If Len(text) < width Then PadRight = text & Space(width - Len(text))
End Function

Function PadLeft(text, width)
  PadLeft = text
  If Len(text) < width Then PadLeft = Space(width - Len(text)) & text
End Function

' 1234567 as 1,234,567.
Function Grouped(number)
  Dim digits, i
  digits = CStr(number)
  i = Len(digits) - 3
  Do While i > 0 And InStr(digits, ".") = 0
    If Mid(digits, i, 1) <> "-" Then digits = Left(digits, i) & "," & Mid(digits, i + 1)
    i = i - 3
  Loop
  Grouped = digits
End Function
