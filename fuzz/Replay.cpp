#include <algorithm>
#include <cstdint>
#include <cstdio>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <string>
#include <vector>

// Runs a fuzz target over the files of folders, one by one, as an ordinary
// program of any compiler. Every input is also given cut off at each length up
// to a few hundred bytes, which costs little and meets most parsers' edges.

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size);

namespace {

constexpr size_t kMaxCuts = 512;

// A copy of exactly that size, so that a sanitizer sees a read beyond it.
void RunInput(const std::string& content, size_t size) {
    const std::vector<uint8_t> bytes(content.begin(),
                                     content.begin() + static_cast<std::ptrdiff_t>(size));
    (void)LLVMFuzzerTestOneInput(bytes.data(), bytes.size());
}

void RunFile(const std::filesystem::path& path) {
    std::ifstream file(path, std::ios::binary);
    const std::string content{std::istreambuf_iterator<char>(file), {}};
    for (size_t size = 0; size < std::min(content.size(), kMaxCuts); ++size) {
        RunInput(content, size);
    }
    RunInput(content, content.size());
}

}  // namespace

int main(int argc, char** argv) {
    size_t files = 0;
    for (int folder = 1; folder < argc; ++folder) {
        for (const auto& entry : std::filesystem::directory_iterator(argv[folder])) {
            if (entry.is_regular_file()) {
                RunFile(entry.path());
                ++files;
            }
        }
    }
    (void)std::printf("%zu inputs\n", files);
    return files > 0 ? 0 : 1;
}
