#include "hosts/linux/download/MimeTypes.h"

#include <algorithm>
#include <cstring>
#include <string_view>

#include "hosts/linux/util/SmallFile.h"

namespace host {

const char kMimeTable[] = "/etc/mime.types";
const char kAnyType[] = "application/octet-stream";

namespace {

constexpr size_t kMaxTableBytes = 1u << 20;
constexpr size_t kMaxTypeBytes = 1024;
constexpr char kBlanks[] = " \t\r\v\f";

struct Known {
    const char* extension;
    const char* type;
};

// For a machine without the table: what browsers show, and what people keep.
const Known kKnown[] = {
    {"7z", "application/x-7z-compressed"},
    {"aac", "audio/aac"},
    {"avi", "video/x-msvideo"},
    {"avif", "image/avif"},
    {"bmp", "image/bmp"},
    {"bz2", "application/x-bzip2"},
    {"css", "text/css"},
    {"csv", "text/csv"},
    {"doc", "application/msword"},
    {"docx", "application/vnd.openxmlformats-officedocument.wordprocessingml.document"},
    {"epub", "application/epub+zip"},
    {"flac", "audio/flac"},
    {"gif", "image/gif"},
    {"gz", "application/gzip"},
    {"heic", "image/heic"},
    {"htm", "text/html"},
    {"html", "text/html"},
    {"ico", "image/vnd.microsoft.icon"},
    {"ics", "text/calendar"},
    {"jpeg", "image/jpeg"},
    {"jpg", "image/jpeg"},
    {"js", "text/javascript"},
    {"json", "application/json"},
    {"m4a", "audio/mp4"},
    {"m4v", "video/mp4"},
    {"md", "text/markdown"},
    {"mkv", "video/x-matroska"},
    {"mov", "video/quicktime"},
    {"mp3", "audio/mpeg"},
    {"mp4", "video/mp4"},
    {"mpeg", "video/mpeg"},
    {"mpg", "video/mpeg"},
    {"odp", "application/vnd.oasis.opendocument.presentation"},
    {"ods", "application/vnd.oasis.opendocument.spreadsheet"},
    {"odt", "application/vnd.oasis.opendocument.text"},
    {"ogg", "audio/ogg"},
    {"pdf", "application/pdf"},
    {"png", "image/png"},
    {"ppt", "application/vnd.ms-powerpoint"},
    {"pptx", "application/vnd.openxmlformats-officedocument.presentationml.presentation"},
    {"rar", "application/vnd.rar"},
    {"rtf", "application/rtf"},
    {"svg", "image/svg+xml"},
    {"tar", "application/x-tar"},
    {"tif", "image/tiff"},
    {"tiff", "image/tiff"},
    {"txt", "text/plain"},
    {"wasm", "application/wasm"},
    {"wav", "audio/x-wav"},
    {"webm", "video/webm"},
    {"webp", "image/webp"},
    {"woff2", "font/woff2"},
    {"xls", "application/vnd.ms-excel"},
    {"xlsx", "application/vnd.openxmlformats-officedocument.spreadsheetml.sheet"},
    {"xml", "application/xml"},
    {"xz", "application/x-xz"},
    {"zip", "application/zip"},
};

std::string Extension(const std::string& fileName) {
    const size_t slash = fileName.rfind('/');
    const size_t start = slash == std::string::npos ? 0 : slash + 1;
    const size_t dot = fileName.rfind('.');
    return dot == std::string::npos || dot <= start ? std::string() : fileName.substr(dot + 1);
}

// A letter, a digit, or one of the marks that a token may have.
bool IsTokenByte(char byte) {
    return (byte >= '0' && byte <= '9') || (byte >= 'A' && byte <= 'Z') ||
           (byte >= 'a' && byte <= 'z') ||
           (byte != '\0' && std::strchr("!#$%&'*+-.^_`|~", byte) != nullptr);
}

bool IsToken(std::string_view text) {
    return !text.empty() && std::all_of(text.begin(), text.end(), IsTokenByte);
}

bool IsType(std::string_view text) {
    const size_t slash = text.find('/');
    return slash != std::string_view::npos && IsToken(text.substr(0, slash)) &&
           IsToken(text.substr(slash + 1));
}

bool SameExtension(std::string_view one, std::string_view other) {
    return one.size() == other.size() &&
           std::equal(one.begin(), one.end(), other.begin(), [](char left, char right) {
               const auto lower = [](char byte) {
                   return byte >= 'A' && byte <= 'Z' ? static_cast<char>(byte - 'A' + 'a') : byte;
               };
               return lower(left) == lower(right);
           });
}

// Takes the next word off a line; "" at its end.
std::string_view TakeWord(std::string_view* line) {
    line->remove_prefix(std::min(line->find_first_not_of(kBlanks), line->size()));
    const std::string_view word = line->substr(0, line->find_first_of(kBlanks));
    line->remove_prefix(word.size());
    return word;
}

// The first line with the extension counts; "" when none has it.
std::string InTable(std::string_view text, std::string_view extension) {
    while (!text.empty()) {
        const size_t end = std::min(text.find('\n'), text.size());
        std::string_view line = text.substr(0, end);
        text.remove_prefix(std::min(end + 1, text.size()));
        const std::string_view type = TakeWord(&line);
        for (std::string_view word = TakeWord(&line); !word.empty(); word = TakeWord(&line)) {
            if (SameExtension(word, extension) && type[0] != '#' && IsType(type)) {
                return std::string(type);
            }
        }
    }
    return std::string();
}

}  // namespace

std::string MimeTypeOf(const std::string& fileName, const char* table) {
    const std::string extension = Extension(fileName);
    if (extension.empty()) {
        return kAnyType;
    }
    std::string text;
    std::string reason;
    if (ReadSmallFile(table, kMaxTableBytes, &text, &reason)) {
        std::string type = InTable(text, extension);
        if (!type.empty()) {
            return type;
        }
    }
    for (const Known& known : kKnown) {
        if (SameExtension(known.extension, extension)) {
            return known.type;
        }
    }
    return kAnyType;
}

std::string CheckedMimeType(const char* text) {
    const std::string type = text != nullptr ? text : "";
    const bool printable =
        std::all_of(type.begin(), type.end(), [](char byte) { return byte >= ' ' && byte <= '~'; });
    const size_t parameters = type.find_first_of("; ");
    return type.size() <= kMaxTypeBytes && printable && IsType(type.substr(0, parameters))
               ? type
               : kAnyType;
}

}  // namespace host
