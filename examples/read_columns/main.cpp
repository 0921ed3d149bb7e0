// SPDX-License-Identifier: MIT
// Reads the IP layers of a capture as an Arrow stream, and prints how many packets each sender sent with which TTL. A
// program with an Arrow library hands the stream over to it instead.
#include <cstdint>
#include <exception>
#include <iostream>
#include <map>
#include <stdexcept>
#include <string>
#include <string_view>
#include <utility>

#include <netfloor-columns/column_stream.h>

namespace {

// The text of a row of a dictionary-encoded column.
std::string_view textAt(const ArrowArray &column, std::int64_t row) {
    const std::int32_t word = static_cast<const std::int32_t *>(column.buffers[1])[row];
    const auto *const offsets = static_cast<const std::int32_t *>(column.dictionary->buffers[1]);
    const auto *const texts = static_cast<const char *>(column.dictionary->buffers[2]);
    return {texts + offsets[word], static_cast<std::size_t>(offsets[word + 1] - offsets[word])};
}

void readColumns(const char *path) {
    ArrowArrayStream stream = {};
    netfloor::openColumns({.path = path, .plugin = PLUGIN_PATH, .columns = {"ip.source", "ip.ttl"}, .where = "ip"},
                          stream);
    std::map<std::pair<std::string, unsigned>, unsigned> packets;
    ArrowArray batch = {};
    int error = 0;
    while ((error = stream.get_next(&stream, &batch)) == 0 && batch.release != nullptr) {
        for (std::int64_t row = 0; row < batch.length; ++row) {
            const unsigned ttl = static_cast<const std::uint8_t *>(batch.children[1]->buffers[1])[row];
            ++packets[{std::string(textAt(*batch.children[0], row)), ttl}];
        }
        batch.release(&batch);
    }
    for (const auto &[sender, count] : packets) {
        std::cout << sender.first << " TTL " << sender.second << ": " << count << '\n';
    }
    const char *const text = error == 0 ? nullptr : stream.get_last_error(&stream);
    const std::string sentence = text == nullptr ? "" : text;
    stream.release(&stream);
    if (error != 0) {
        throw std::runtime_error(sentence);
    }
}

} // namespace

int main(int argumentCount, char **arguments) {
    if (argumentCount != 2) {
        std::cerr << "usage: read_columns FILE\n";
        return 2;
    }
    try {
        readColumns(arguments[1]);
    } catch (const std::exception &error) { // damage comes after the rows of the whole packets before it
        std::cout.flush();
        std::cerr << error.what() << '\n';
        return 1;
    }
}
