// Which names users and files may have, and when two of them are too alike. All texts are UTF-8.
#pragma once

#include <string>
#include <string_view>

namespace tarnwick::hosting {

// Whether no file may have this name.
bool IsRefusedFileName(std::string_view name);

// Whether no account may have this name.
bool IsRefusedUserName(std::string_view name);

// The name in small letters, for comparisons without letter case.
std::string FoldCase(std::string_view name);

// The characters that the parameter cipher keeps.
std::string Strip(std::string_view text);

// Name of the user's folder below the users' folder.
std::string FolderOf(std::string_view userName);

}  // namespace tarnwick::hosting
