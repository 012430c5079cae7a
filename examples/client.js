// Lists the files of an account. Run it with
//   cscript //nologo client.js SERVER USER PASSWORD PRODUCT
var server = WScript.Arguments(0), user = WScript.Arguments(1);
var password = WScript.Arguments(2), product = WScript.Arguments(3);

function fail(reason) {
  WScript.Echo(reason);
  WScript.Quit(1);
}

var client = new ActiveXObject("Tarnwick.CFileUpload");
if (!client.ConnectToServer(server)) fail("There is no service at " + server);
if (!client.LogonAs(product, user, password, "")) fail("The service does not know this user or password");

// JScript passes no variable by reference, so the host brings a collection: any object with a method Add.
var count = 0;
var files = {
  Add: function (file, address) {
    WScript.Echo(file.FileName + ", " + file.FileSize + " bytes, " + address);
    ++count;
  }
};
if (!client.ListFilesForUser(files)) fail("The files could not be listed");
WScript.Echo(count + " files, " + client.GetTotalUsedQuota(product, user) + " of " +
  client.GetMaxQuota(product, user) + " bytes used");
