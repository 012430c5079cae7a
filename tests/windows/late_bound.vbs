' A script host that is bound late: what scripts pass and get, against a running hosting server.
' Arguments: SERVER USER PASSWORD PRODUCT
Option Explicit
Dim passed, failed, description
passed = 0
failed = 0

Sub Check(what, seen, wanted)
  ' A wrong type is a failure, too.
  If TypeName(seen) = TypeName(wanted) Then
    If seen = wanted Then
      passed = passed + 1
      Exit Sub
    End If
  End If
  failed = failed + 1
  WScript.Echo "FAILED " & what & ": " & TypeName(seen) & " " & seen & ", not " & TypeName(wanted) & " " & wanted
End Sub

' The number of the error that one of these statements raises, 0 for none. Everywhere else an error ends the script, before it says
' how many checks passed.
Function NumberOf(statement)
  On Error Resume Next
  Select Case statement
    Case 1
      list.Add "x", "key a"
    Case 2
      list.Item 5
    Case 3
      list.Remove "key x"
    Case 4
      list.Frobnicate
    Case 5
      Set client.UploadObject = list
    Case 6
      client.EmailKeyToUser product, user, "no number"
  End Select
  NumberOf = Err.Number
  description = Err.Description
End Function

Dim arguments, server, user, password, product
Set arguments = WScript.Arguments
server = arguments(0)
user = arguments(1)
password = arguments(2)
product = arguments(3)

Dim client
Set client = CreateObject("Tarnwick.CFileUpload")
Check "version-dependent ProgID", TypeName(CreateObject("Tarnwick.CFileUpload.1")), "_CFileUpload"

client.HTTPServer = server
Check "names in any letter case", CLIENT.encodestring("a+b"), "a%2Bb"
Check "wrong password", client.LogonAs(product, user, "wrong", ""), False
Check "ConnectToServer", client.ConnectToServer(server), True
Check "a number where a text is wanted", client.LogonAs(CInt(product), user, password, ""), True

' By-reference collections.
Dim files, file, found
Set files = Nothing
Check "ListFilesForUser, Nothing", client.ListFilesForUser(files), True
Check "a collection came back", files.Count > 2, True
found = 0
For Each file In files
  If file.FileSize > 0 And files(file.FilePath).FileName = file.FileName Then found = found + 1
Next
Check "For Each and keys", CLng(found), files.Count
Dim fresh
Check "ListFilesForUser, Empty", client.ListFilesForUser(fresh), True
Check "a collection of files already", client.ListFilesForUser(fresh), False
Dim dictionary
Set dictionary = CreateObject("Scripting.Dictionary")
Check "ListFilesForUser, a dictionary", client.ListFilesForUser(dictionary), True
Check "it was filled", CLng(dictionary.Count), files.Count
' The collection.
Dim list
Set list = fresh
Do While list.Count > 0
  list.Remove 1
Loop
list.Add "b", "key b"
list.Add "d"
list.Add "a", "key a", 1
list.Add "c", , , "key b"
Dim all
all = ""
For Each file In list
  all = all & file
Next
Check "Add with positions", all, "abcd"
Check "Item", list.Item(2) & list("key a") & list(4), "bad"
Check "key in use", NumberOf(1), CLng(457)
Check "position out of range", NumberOf(2), CLng(9)
Check "its description", description, "There is no item at this position"
Check "unknown key", NumberOf(3), CLng(5)
Check "unknown member", NumberOf(4), CLng(438)

' Records are objects of the library.
Dim record
Set record = client.UploadObject
record.FileName = "name"
record.FileSize = "12"
Check "a text where a number is wanted", client.UploadObject.FileSize, CDbl(12)
Set client.UploadObject = Nothing
Check "a new one after Nothing", client.UploadObject.FileName, ""
Set client.UploadObject = record
Check "the old one set", client.UploadObject.FileName, "name"
Check "an object of another class", NumberOf(5) <> 0, True
Dim account
Set account = CreateObject("Tarnwick.CBVAccount")
account.Quota = 12.5
Check "a VARIANT keeps its type", account.Quota, CDbl(12.5)

' Typed references: variables of other types, plain values, nothing at all.
Dim newUser
newUser = 1
Check "EmailKeyToUser, a variable", client.EmailKeyToUser(product, user, newUser), CLng(1001)
Check "which keeps its type", TypeName(newUser), "Integer"
Check "EmailKeyToUser, a value", client.EmailKeyToUser(product, user, CByte(0)), CLng(1001)
Check "EmailKeyToUser, no number", NumberOf(6), CLng(13)
Check "FileExists, a value", client.FileExists("x"), False
Check "AbortFileTransfer, a value", client.AbortFileTransfer(True), Empty
Check "GetTotalUsedQuota", TypeName(client.GetTotalUsedQuota(product, user)), "Double"
Check "GetTotalUsedQuota of nobody", client.GetTotalUsedQuota(product, "nobody"), Empty
client.DisconnectFromServer

WScript.Echo passed & " passed, " & failed & " failed"
If failed > 0 Then WScript.Quit 1
