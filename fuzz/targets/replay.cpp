// SPDX-License-Identifier: MIT
// Runs a fuzz target over inputs that are known, without a fuzzer:
//
//     replay_TARGET PATH...    a PATH is a file with one input, or a folder of such files
#include <cstdint>
#include <cstdio>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <string>
#include <vector>

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t *data, std::size_t size);

// A target's own mutator asks for the fuzzer's, which is not there and not needed.
extern "C" std::size_t LLVMFuzzerMutate(std::uint8_t *, std::size_t size, std::size_t) {
    return size;
}

namespace {

namespace fs = std::filesystem;

std::vector<fs::path> filesOf(const fs::path &path) {
    if (!fs::is_directory(path)) {
        return {path};
    }
    const fs::directory_iterator listed(path);
    return {begin(listed), end(listed)};
}

bool runOne(const fs::path &path) {
    std::ifstream file(path, std::ios::binary);
    // In memory of their own size, so that a sanitizer sees a read past them.
    const std::string octets((std::istreambuf_iterator<char>(file)), std::istreambuf_iterator<char>());
    const std::vector<std::uint8_t> input(octets.begin(), octets.end());
    LLVMFuzzerTestOneInput(input.data(), input.size());
    return file.good() || file.eof();
}

} // namespace

int main(int count, char **arguments) {
    std::size_t inputs = 0;
    for (int i = 1; i < count; ++i) {
        for (const fs::path &file : filesOf(arguments[i])) {
            if (!runOne(file)) {
                std::fprintf(stderr, "replay: %s cannot be read\n", file.c_str());
                return 2;
            }
            ++inputs;
        }
    }
    std::printf("%zu inputs\n", inputs);
    return inputs > 0 ? 0 : 2;
}
