#include "PlaceFixture.h"

#include <unistd.h>

#include <filesystem>
#include <fstream>
#include <iterator>
#include <sstream>

#include "hosts/linux/file/Resolve.h"

namespace fs = std::filesystem;

PlaceFixture::PlaceFixture() {
    fs::create_directories(InShare(""));
    fs::create_directories(Outside(""));
    std::ofstream(Outside("secret")) << "SECRET";
}

std::string PlaceFixture::InShare(const std::string& path) const {
    return folder_.Path("share/" + path);
}

std::string PlaceFixture::Outside(const std::string& path) const {
    return folder_.Path("outside/" + path);
}

void PlaceFixture::Write(const std::string& path, const std::string& content) const {
    fs::create_directories(fs::path(InShare(path)).parent_path());
    std::ofstream(InShare(path), std::ios::binary) << content;
}

void PlaceFixture::MakeFolders(const std::string& path) const {
    fs::create_directories(InShare(path));
}

void PlaceFixture::Link(const std::string& path, const std::string& target) const {
    ASSERT_EQ(0, symlink(target.c_str(), InShare(path).c_str())) << path;
}

void PlaceFixture::At(const std::string& path, talo::Place* place) const {
    talo::Share share;
    share.name = "share";
    share.folder = InShare("");
    ASSERT_EQ(talo::FileError::kNone, place->Open(share, Split(path)));
}

std::string PlaceFixture::Read(const std::string& path) const {
    talo::Place place;
    int file = -1;
    At(path, &place);
    const talo::FileError result = place.OpenFile(&file);
    if (result != talo::FileError::kNone) {
        EXPECT_EQ(-1, file);
        return "error " + std::to_string(static_cast<int>(result));
    }
    std::string content;
    char block[256];
    for (ssize_t got = 0; (got = read(file, block, sizeof block)) > 0;) {
        content.append(block, static_cast<size_t>(got));
    }
    (void)close(file);
    return content;
}

std::string PlaceFixture::ContentOf(const std::string& path) {
    std::ifstream file(path, std::ios::binary);
    return std::string(std::istreambuf_iterator<char>(file), {});
}

void PlaceFixture::ExpectOutsideUntouched() const {
    size_t count = 0;
    for (const auto& entry : fs::directory_iterator(Outside(""))) {
        ++count;
        EXPECT_EQ("secret", entry.path().filename());
    }
    EXPECT_EQ(1, count);
    EXPECT_EQ("SECRET", ContentOf(Outside("secret")));
}

void BothResolvers::SetUp() {
    host::AlwaysWalk(Walks());
}

void BothResolvers::TearDown() {
    host::AlwaysWalk(false);
}

std::vector<std::string> Split(const std::string& path) {
    std::vector<std::string> parts;
    std::stringstream stream(path);
    for (std::string part; std::getline(stream, part, '/');) {
        parts.push_back(part);
    }
    return parts;
}

void talo::PrintTo(FileError error, std::ostream* out) {
    *out << "FileError " << static_cast<int>(error);
}
