#include "hosts/linux/util/LineFile.h"

#include <errno.h>
#include <fcntl.h>
#include <string.h>
#include <sys/file.h>
#include <sys/stat.h>
#include <unistd.h>

#include "hosts/linux/util/Descriptor.h"
#include "hosts/linux/util/SmallFile.h"
#include "platform/System.h"

namespace host {

namespace {

bool Refuse(std::string* problem, const std::string& text) {
    *problem = text;
    return false;
}

int OpenLock(const std::string& path) {
    const int file = open((path + ".lock").c_str(), O_RDWR | O_CREAT | O_CLOEXEC | O_NOFOLLOW,
                          S_IRUSR | S_IWUSR);
    if (file < 0) {
        return -1;
    }
    while (flock(file, LOCK_EX) != 0) {
        if (errno != EINTR) {
            (void)close(file);
            return -1;
        }
    }
    return file;
}

}  // namespace

void EraseLine(std::string* content, const LinePlace& place) {
    content->erase(place.start, place.end + 1 - place.start);
}

void AppendLine(std::string* content, const std::string& line) {
    if (!content->empty() && content->back() != '\n') {
        *content += '\n';
    }
    *content += line + '\n';
}

bool ChangeLineFile(const LineFile& file, const ContentChange& change, std::string* problem) {
    const std::string path = file.path;
    if (TALOFSMkdirP(path.substr(0, path.rfind('/')).c_str(), 0, 1, -1, -1, 0755) < 0) {
        return Refuse(problem, "cannot make the folder of " + path + ": " + strerror(errno));
    }
    const Descriptor lock(OpenLock(path));
    if (lock.Get() < 0) {
        return Refuse(problem, "cannot lock " + path + ": " + strerror(errno));
    }
    std::string content;
    if (!file.read(path, file.maxBytes, &content)) {
        return Refuse(problem, "cannot use " + path + "; the system log says why");
    }
    if (!change(&content, problem)) {
        return false;
    }
    if (content.size() > file.maxBytes) {
        return Refuse(problem, std::string("the ") + file.what + " is full");
    }
    if (!ReplaceFile(path, content)) {
        return Refuse(problem, "cannot write " + path + ": " + strerror(errno));
    }
    return true;
}

}  // namespace host
