#include "LQ_FileUtils.h"

#include <dirent.h>
#include <sys/stat.h>
#include <sys/types.h>
#include <unistd.h>

#include <cstring>
#include <fstream>
#include <sstream>

#include "LQ_Utils.h"

namespace LQ {

namespace {
const size_t MIN_PATH_LENGTH = 1;

// Calls visit(name) for each entry of an open directory but "." and "..".
template <class Visit>
bool forEachEntry(const std::string& path, Visit visit) {
    DIR* directory = opendir(path.c_str());
    if (!directory) return false;
    while (const dirent* entry = readdir(directory)) {
        if (std::strcmp(entry->d_name, ".") == 0 || std::strcmp(entry->d_name, "..") == 0) continue;
        visit(std::string(entry->d_name));
    }
    closedir(directory);
    return true;
}
}  // namespace

std::string getFileName(const std::string& path) {
    const size_t slash = path.rfind('/');
    return slash == std::string::npos ? path : path.substr(slash + 1);
}

std::string getFileDirectory(const std::string& path) {
    const size_t slash = path.rfind('/');
    return slash == std::string::npos ? std::string() : path.substr(0, slash);
}

std::string getFileExtention(const std::string& path) {
    const std::string name = getFileName(path);
    const size_t dot = name.rfind('.');
    return dot == std::string::npos ? std::string() : name.substr(dot);
}

std::string getFileNameBase(const std::string& path) {
    const std::string name = getFileName(path);
    return name.substr(0, name.rfind('.'));
}

std::string fixSeparator(const std::string& path) {
    return replaceChar(path, '\\', '/');
}

std::string fixPath(const std::string& path) {
    return replaceString("\"" + fixSeparator(path) + "\"", "$", "\\$");
}

bool isFileExists(const std::string& path) {
    return std::ifstream(path.c_str()).is_open();
}

bool isDirectory(const std::string& path) {
    DIR* directory = opendir(path.c_str());
    if (!directory) return false;
    closedir(directory);
    return true;
}

bool isFullPath(const std::string& path) {
    LQ_ASSERT_MSG(path.length() >= MIN_PATH_LENGTH, "'" << path << "' seems to be not a directory");
    return path[0] == '/';
}

std::string getCurrentDirectory() {
    char cCurrentPath[1024];
    LQ_ASSERT(getcwd(cCurrentPath, sizeof(cCurrentPath)));
    return cCurrentPath;
}

long getFileSize(const std::string& path) {
    if (!isFileExists(path)) return -1;
    struct stat status;
    if (stat(path.c_str(), &status) != 0 || !S_ISREG(status.st_mode)) return -1;
    return static_cast<long>(status.st_size);
}

long getModificationTime(const std::string& path) {
    struct stat attributes;
    const int status = stat(path.c_str(), &attributes);
    LQ_ASSERT_MSG(!status, "error during getting modification time of " << path);
    return static_cast<long>(attributes.st_mtime);
}

std::string cat(const std::string& path) {
    std::ifstream file(path.c_str(), std::ios::binary);
    std::ostringstream content;
    content << file.rdbuf();
    return content.str();
}

void createParentDirectories(const std::string& path) {
    const size_t slash = path.rfind('/');
    if (slash == std::string::npos) return;
    const std::string directory = path.substr(0, slash);
    for (size_t end = 0; end <= directory.size(); ++end) {
        if (end < directory.size() && directory[end] != '/') continue;
        // a leading "/" gives no prefix
        if (end == 0) continue;
        const std::string prefix = directory.substr(0, end);
        DIR* existing = opendir(prefix.c_str());
        if (existing) {
            closedir(existing);
            continue;
        }
        mkdir(prefix.c_str(), 0777);
    }
}

bool checkExtensions(const std::string& name, const std::vector<std::string>& extensions) {
    for (const std::string& extension : extensions) {
        if (name.size() >= extension.size() &&
            name.compare(name.size() - extension.size(), extension.size(), extension) == 0)
            return true;
    }
    return false;
}

bool readDirectories(const std::string& path, std::vector<std::string>& list, bool recursive) {
    if (!isDirectory(path)) return false;
    list.push_back(path);
    forEachEntry(path, [&](const std::string& name) {
        if (name.compare("..") <= 0) return;
        const std::string child = path + "/" + name;
        if (!isDirectory(child)) return;
        if (recursive)
            readDirectories(child, list, true);
        else
            list.push_back(child);
    });
    return true;
}

void readFiles(const std::string& path, std::vector<std::string>& list, const std::string& extension,
               bool recursive) {
    readFiles(path, list, std::vector<std::string>{extension}, recursive);
}

void readFiles(const std::string& path, std::vector<std::string>& list,
               const std::vector<std::string>& extensions, bool recursive) {
    if (!isDirectory(path)) {
        if (isFileExists(path) && checkExtensions(path, extensions)) list.push_back(path);
        return;
    }
    forEachEntry(path, [&](const std::string& name) {
        const std::string child = path + "/" + name;
        if (isDirectory(child)) {
            if (recursive) readFiles(child, list, extensions, true);
        } else if (checkExtensions(child, extensions)) {
            list.push_back(child);
        }
    });
}

void readImages(const std::string& path, std::vector<std::string>& list, bool recursive) {
    readFiles(path, list, getSupportedImageExtentions(), recursive);
}

void readVideos(const std::string& path, std::vector<std::string>& list, bool recursive) {
    readFiles(path, list, getSupportedVideoExtentions(), recursive);
}

const std::vector<std::string>& getSupportedImageExtentions() {
    static const std::vector<std::string> extensions{".jpg", ".png", ".pgm",  ".jpeg", ".bmp",
                                                     ".dib", ".jpe", ".pbm",  ".ppm",  ".tiff",
                                                     ".tif", ".jp2", ".ascii"};
    return extensions;
}

const std::vector<std::string>& getSupportedVideoExtentions() {
    static const std::vector<std::string> extensions{".avi", ".mp4", ".wmv", ".mkv", ".dat", ".AVI", ".MOV"};
    return extensions;
}

}  // namespace LQ
