// A script host that is bound late and passes everything by value, against a running hosting server.
// Arguments: SERVER USER PASSWORD PRODUCT
var passed = 0;
var failed = 0;

function check(what, seen, wanted) {
  if (seen === wanted) {
    passed++;
  } else {
    failed++;
    WScript.Echo("FAILED " + what + ": " + typeof seen + " " + seen + ", not " + typeof wanted + " " + wanted);
  }
}

var server = WScript.Arguments(0);
var user = WScript.Arguments(1);
var password = WScript.Arguments(2);
var product = WScript.Arguments(3);

var client = new ActiveXObject("Tarnwick.CFileUpload");
check("ConnectToServer", client.ConnectToServer(server), true);
check("LogonAs", client.LogonAs(product, user, password, ""), true);

// A collection is any object with the right members, also one of the script's own.
var own = {
  items: [],
  Add: function (item, key) { this.items.push(item.FileName + "|" + key); }
};
check("ListFilesForUser, an object of the script", client.ListFilesForUser(own), true);
check("with keys", own.items[0].indexOf("|" + (/^https:/.test(server) ? "" : "http://") + server + "/users/") > 0, true);
check("an object without Add", client.ListFilesForUser({}), false);
check("null, whose result is lost", client.ListFilesForUser(null), true);

// Properties are put by reference and by value at once.
var record = client.UploadObject;
record.FileName = "of the script";
client.UploadObject = record;
check("UploadObject", client.UploadObject.FileName, "of the script");
client.UploadObject = null;
check("UploadObject, null", client.UploadObject.FileName, "");
check("GetKeyForUser, a number for a text", client.GetKeyForUser(7, "nobody"), "1004");

WScript.Echo(passed + " passed, " + failed + " failed");
WScript.Quit(failed > 0 ? 1 : 0);
