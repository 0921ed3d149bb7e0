// SPDX-License-Identifier: MIT
// Runs a fuzz target over inputs that are known, without a fuzzer, and moves them between the two forms they have: one
// file in the repository, and a folder with a file each for the fuzzer.
//
//     replay_TARGET FILE             runs the target over all inputs of the file
//     replay_TARGET --input FILE     runs it over one input, which is the whole file
//     replay_TARGET --unpack FILE FOLDER [ZEROS]    ZEROS octets of 0 in front of each, where FILE holds packets
//     replay_TARGET --pack FILE FOLDER
//
// In the one file, each input comes after its number of octets in four octets, the first the highest.
#include <cstdint>
#include <cstdio>
#include <cstring>
#include <exception>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <set>
#include <stdexcept>
#include <string>
#include <vector>

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t *data, std::size_t size);

// A target's own mutator asks for the fuzzer's, which is not there and not needed.
extern "C" std::size_t LLVMFuzzerMutate(std::uint8_t *, std::size_t size, std::size_t) {
    return size;
}

namespace {

using Octets = std::vector<std::uint8_t>;

Octets content(const std::filesystem::path &path) {
    std::ifstream file(path, std::ios::binary);
    if (!file) {
        throw std::runtime_error(path.string() + " cannot be read");
    }
    const std::string octets((std::istreambuf_iterator<char>(file)), std::istreambuf_iterator<char>());
    return {octets.begin(), octets.end()};
}

std::vector<Octets> packedInputs(const std::filesystem::path &path) {
    const Octets octets = content(path);
    std::vector<Octets> inputs;
    for (std::size_t at = 0; at < octets.size();) {
        std::size_t size = 0;
        for (const std::size_t end = at + 4; at < end; ++at) {
            size = size << 8 | octets.at(at);
        }
        if (size > octets.size() - at) {
            throw std::runtime_error(path.string() + " is no file of inputs");
        }
        const auto from = octets.begin() + static_cast<std::ptrdiff_t>(at);
        inputs.emplace_back(from, from + static_cast<std::ptrdiff_t>(size));
        at += size;
    }
    return inputs;
}

void write(std::ofstream &file, const Octets &octets) {
    file.write(reinterpret_cast<const char *>(octets.data()), static_cast<std::streamsize>(octets.size()));
}

void unpack(const std::filesystem::path &path, const std::filesystem::path &folder, std::size_t zeros) {
    std::filesystem::create_directories(folder);
    for (std::size_t number = 0; const Octets &input : packedInputs(path)) {
        std::ofstream file(folder / (path.stem().string() + '-' + std::to_string(number++)), std::ios::binary);
        write(file, Octets(zeros));
        write(file, input);
    }
}

void pack(const std::filesystem::path &path, const std::filesystem::path &folder) {
    const std::filesystem::directory_iterator listed(folder);
    std::ofstream file(path, std::ios::binary);
    std::set<Octets> inputs;
    for (const auto &one : listed) {
        inputs.insert(content(one.path()));
    }
    for (const Octets &input : inputs) {
        for (int shift = 24; shift >= 0; shift -= 8) {
            file.put(static_cast<char>(input.size() >> shift & 0xff));
        }
        write(file, input);
    }
    if (!file.flush()) {
        throw std::runtime_error(path.string() + " cannot be written");
    }
}

// The octets in memory of their own, so that a sanitizer sees a read past them.
void runOne(const Octets &input) {
    const Octets own(input);
    LLVMFuzzerTestOneInput(own.data(), own.size());
}

void runAll(const std::filesystem::path &path) {
    const std::vector<Octets> inputs = packedInputs(path);
    for (const Octets &input : inputs) {
        runOne(input);
    }
    std::printf("%zu inputs\n", inputs.size());
}

} // namespace

int main(int count, char **arguments) {
    try {
        const std::vector<std::string> words(arguments + 1, arguments + count);
        if (words.size() == 1) {
            runAll(words[0]);
        } else if (words.size() == 2 && words[0] == "--input") {
            runOne(content(words[1]));
        } else if (words.size() >= 3 && words[0] == "--unpack") {
            unpack(words[1], words[2], words.size() > 3 ? std::stoul(words[3]) : 0);
        } else if (words.size() == 3 && words[0] == "--pack") {
            pack(words[1], words[2]);
        } else {
            throw std::runtime_error(
                "usage: replay FILE | --input FILE | --unpack FILE FOLDER [ZEROS] | --pack FILE FOLDER");
        }
        return 0;
    } catch (const std::exception &error) {
        std::fprintf(stderr, "replay: %s\n", error.what());
        return 2;
    }
}
