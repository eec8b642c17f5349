#include "Zip.h"

#include <errno.h>
#include <unistd.h>

#include <algorithm>
#include <set>

#include "hosts/linux/sdk/Archive.h"
#include "hosts/linux/sdk/Downloads.h"

namespace {

bool WriteAll(const std::string& text) {
    for (size_t written = 0; written < text.size();) {
        const ssize_t put = write(STDOUT_FILENO, text.data() + written, text.size() - written);
        if (put < 0 && errno == EINTR) {
            continue;
        }
        if (put <= 0) {
            return false;
        }
        written += static_cast<size_t>(put);
    }
    return true;
}

std::string HeaderFor(const std::string& name) {
    return "Content-type: application/zip\r\n"
           "Content-Disposition: " +
           talo::AttachmentNamed(name) +
           "\r\n"
           "X-Content-Type-Options: nosniff\r\n"
           "Cache-Control: private, no-cache\r\n\r\n";
}

// The names in the archive are UTF-8: a name that is not is written with its
// bytes above ASCII as "%C3".
std::string ArchiveName(const std::string& name) {
    constexpr char kDigits[] = "0123456789ABCDEF";
    if (talo::IsComponent(name)) {
        return name;
    }
    std::string text;
    for (const char byte : name) {
        const unsigned value = static_cast<unsigned char>(byte);
        if (value < 0x80) {
            text += byte;
        } else {
            text += '%';
            text += kDigits[value >> 4];
            text += kDigits[value & 15];
        }
    }
    return text;
}

std::string ArchivePath(const std::string& path) {
    std::string text;
    for (size_t start = 0; start <= path.size();) {
        const size_t end = std::min(path.find('/', start), path.size());
        text += (start > 0 ? "/" : "") + ArchiveName(path.substr(start, end - start));
        start = end + 1;
    }
    return text;
}

// "a.txt", "a (2).txt", "a (3).txt"
std::string UniqueName(const std::string& name, std::set<std::string>* taken) {
    const size_t dot = name.rfind('.');
    const size_t stem = dot == std::string::npos || dot == 0 ? name.size() : dot;
    std::string candidate = name;
    for (size_t number = 2; !taken->insert(candidate).second; ++number) {
        candidate = name.substr(0, stem) + " (" + std::to_string(number) + ")" + name.substr(stem);
    }
    return candidate;
}

bool AddOne(const talo::Place& place, const std::string& name, const talo::FileFacts& facts,
            talo::ZipWriter* zip) {
    int file = -1;
    if (place.OpenFile(&file) != talo::FileError::kNone) {
        return false;
    }
    const bool added = zip->AddFile(name, facts.mtime, facts.size, file);
    (void)close(file);
    return added;
}

bool AddTree(const talo::Place& place, const std::string& name, const talo::FileFacts& facts,
             talo::ZipWriter* zip) {
    if (!zip->AddFolder(name, facts.mtime)) {
        return false;
    }
    return place.Walk(true, [&](const talo::TreeEntry& entry) {
        const std::string path = name + "/" + ArchivePath(entry.path);
        switch (entry.facts.type) {
            case talo::FileType::kFolder:
                return zip->AddFolder(path, entry.facts.mtime);
            case talo::FileType::kFile:
                return zip->AddFile(path, entry.facts.mtime, entry.facts.size, entry.file);
            default:
                return true;
        }
    }) == talo::FileError::kNone;
}

bool Add(const Target& target, const std::string& name, talo::ZipWriter* zip) {
    talo::FileFacts facts;
    if (target.place.Stat(&facts) != talo::FileError::kNone) {
        return false;
    }
    return facts.type == talo::FileType::kFolder ? AddTree(target.place, name, facts, zip)
                                                 : AddOne(target.place, name, facts, zip);
}

}  // namespace

bool SendZip(const std::vector<std::unique_ptr<Target>>& targets, bool onlyHeader) {
    talo::ZipWriter zip(STDOUT_FILENO);
    if (!zip.IsOpen()) {
        return false;
    }
    const std::string name = targets.size() == 1 ? targets.front()->Name() : "download";
    if (!WriteAll(HeaderFor(name + ".zip")) || onlyHeader) {
        return true;
    }
    std::set<std::string> taken;
    for (const auto& target : targets) {
        if (!Add(*target, UniqueName(target->Name(), &taken), &zip)) {
            return true;
        }
    }
    (void)zip.Finish();
    return true;
}
