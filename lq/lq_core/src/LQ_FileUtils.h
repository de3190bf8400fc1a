#pragma once
// Paths, files and directories. Paths use "/" only; the functions that pick a path apart
// look for "/" and "." and never touch the file system.

#include <string>
#include <vector>

namespace LQ {

// ---- path texts ---------------------------------------------------------------

// behind the last "/"; the whole text if there is none
std::string getFileName(const std::string& path);
// before the last "/", without it; empty if there is none
std::string getFileDirectory(const std::string& path);
// from the last "." of the file name on, dot included; empty if the name has none
std::string getFileExtention(const std::string& path);
// the file name before its last "."
std::string getFileNameBase(const std::string& path);
// backslashes to "/"
std::string fixSeparator(const std::string& path);
// a form for handing a path to a shell: separators fixed, quoted, "$" escaped
std::string fixPath(const std::string& path);

// ---- file system --------------------------------------------------------------

// The question functions report a missing file by their result, without logging.
bool isFileExists(const std::string& path);
bool isDirectory(const std::string& path);
// An empty path is a caller's error, not a relative one.
bool isFullPath(const std::string& path);
std::string getCurrentDirectory();
// bytes, or -1 when the file can't be opened or isn't a regular file
long getFileSize(const std::string& path);
// seconds since the epoch
long getModificationTime(const std::string& path);
// the whole content; empty when the file can't be read
std::string cat(const std::string& path);
// Makes each missing directory on the way to the file. mkdir's result is not examined:
// a directory that can't be made shows when the caller opens the file.
void createParentDirectories(const std::string& path);

// true if name ends in one of the texts, case-sensitively
bool checkExtensions(const std::string& name, const std::vector<std::string>& extensions);
// False if path isn't a directory; else appends path, then its subdirectories as
// parent/name (depth first when recursive). Only names that sort after ".." count.
bool readDirectories(const std::string& path, std::vector<std::string>& list, bool recursive);
// Appends the files that pass checkExtensions, in readdir order. A path that is no
// directory is appended itself when it can be read and passes.
void readFiles(const std::string& path, std::vector<std::string>& list, const std::string& extension,
               bool recursive);
void readFiles(const std::string& path, std::vector<std::string>& list,
               const std::vector<std::string>& extensions, bool recursive);
void readImages(const std::string& path, std::vector<std::string>& list, bool recursive);
void readVideos(const std::string& path, std::vector<std::string>& list, bool recursive);

const std::vector<std::string>& getSupportedImageExtentions();
const std::vector<std::string>& getSupportedVideoExtentions();

}  // namespace LQ
