#include <dirent.h>
#include <fcntl.h>
#include <sys/stat.h>
#include <sys/xattr.h>
#include <unistd.h>

#include <cerrno>
#include <cstdio>
#include <functional>
#include <map>

#include "attempts.h"

namespace vlm::test {

namespace {

int errorOf(int result) { return result < 0 ? errno : 0; }

int openAndClose(const char* path, int flags) {
    const int file = open(path, flags | O_CLOEXEC, 0600);
    if (file < 0) return errno;
    close(file);
    return 0;
}

int readOneByte(const char* path) {
    const int file = open(path, O_RDONLY | O_CLOEXEC);
    if (file < 0) return errno;
    char byte = 0;
    const int error = errorOf(static_cast<int>(read(file, &byte, 1)));
    close(file);
    return error;
}

int list(const char* path) {
    DIR* folder = opendir(path);
    if (folder == nullptr) return errno;
    closedir(folder);
    return 0;
}

const std::map<std::string, std::function<int(const char*)>> kOnOnePath = {
    {"read", readOneByte},
    {"list", list},
    {"overwrite", [](const char* path) { return openAndClose(path, O_WRONLY); }},
    {"create", [](const char* path) { return openAndClose(path, O_WRONLY | O_CREAT | O_EXCL); }},
    {"empty", [](const char* path) { return openAndClose(path, O_WRONLY | O_TRUNC); }},
    {"truncate", [](const char* path) { return errorOf(truncate(path, 0)); }},
    {"unlink", [](const char* path) { return errorOf(unlink(path)); }},
    {"mkdir", [](const char* path) { return errorOf(mkdir(path, 0700)); }},
    {"rmdir", [](const char* path) { return errorOf(rmdir(path)); }},
    {"symlink", [](const char* path) { return errorOf(symlink("/etc/passwd", path)); }},
    {"chmod", [](const char* path) { return errorOf(chmod(path, 0644)); }},
    {"chown", [](const char* path) { return errorOf(chown(path, geteuid(), getegid())); }},
    {"setxattr", [](const char* path) { return errorOf(setxattr(path, "user.vlm", "1", 1, 0)); }},
};

}  // namespace

int attemptOnFiles(const std::string& name, Arguments arguments) {
    if (name == "rename") return errorOf(rename(arguments[0].c_str(), arguments[1].c_str()));
    if (name == "link") return errorOf(link(arguments[0].c_str(), arguments[1].c_str()));
    const auto found = kOnOnePath.find(name);
    return found == kOnOnePath.end() ? -1 : found->second(arguments[0].c_str());
}

}  // namespace vlm::test
