#pragma once
// The program's folders: the initial directory, the resource path (the folder that holds
// "Resources/") and the shared base path with the shared folder below it, where the lock
// file, the song's working files and the undo folder live. Resolved at start-up.

#include <string>

struct Paths {
    std::string initialDirectory;   // current directory at start, ending in "/"
    std::string resourcePath;       // folder that contains "Resources/", ending in "/"
    std::string sharedBasePath;     // ending in "/"; set by loadDataPaths or the command line
    std::string sharedFolder;       // sharedBasePath + "Torvellan Shared/"
};
extern Paths paths;

// Sets the initial directory and both paths to dir (a "/" is appended when missing).
void setInitialDirectory(const std::string& dir);
// Sets the shared base path (a "/" is appended when missing) and the shared folder below it.
void setSharedBasePath(const std::string& base);
// Resolves the shared base path and the resource path from the "DataPath" keys of both
// roots; 1 on success, 0 when a key could not be opened (its message has been shown).
int loadDataPaths();
// Writes "TorvellanSharedPath" below the user's root, adding a trailing "/" when missing.
int saveSharedPath(const std::string& path);

// shared folder + name (working files: "CS.fw", "CSUndo/", ...)
std::string sharedFilePath(const std::string& name);
// resource path + "Resources/" + name
std::string resourceFilePath(const std::string& name);
