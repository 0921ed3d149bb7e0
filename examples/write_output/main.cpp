// SPDX-License-Identifier: MIT
// The shortest output: a tree of the fields of each packet, written as the plug-in reports them. Nothing is kept, and
// the headers of a tunnel are shown side by side.
#include <cstdint>
#include <iostream>
#include <string>
#include <string_view>

#include <netfloor-host/plugin_host.h>

namespace {

class TreeOutput final : public netfloor::Sink {
public:
    void blockOpened(const netfloor::BlockView &block) override { line(block.depth, block.name); }
    void field(const netfloor::FieldView &field) override {
        if (const std::string_view text = field.text.view(); !text.empty()) {
            line(field.depth, text);
        }
    }

private:
    static void line(std::uint32_t depth, std::string_view text) {
        std::cout << std::string(std::size_t{2} * depth, ' ') << text << '\n';
    }
};

constexpr std::uint8_t packet[] = {
    0x60, 0x00, 0x00, 0x00, 0x00, 0x34, 0x29, 0x40,                         // IPv6, IPv6 follows
    0x20, 0x01, 0x0d, 0xb8, 0,    0,    0,    0,    0, 0, 0, 0, 0, 0, 0, 1, // from 2001:db8::1
    0x20, 0x01, 0x0d, 0xb8, 0,    0,    0,    0,    0, 0, 0, 0, 0, 0, 0, 2, // to 2001:db8::2
    0x60, 0x00, 0x00, 0x00, 0x00, 0x0c, 0x11, 0x40,                         // IPv6, UDP follows
    0x20, 0x01, 0x0d, 0xb8, 0,    0,    0,    0,    0, 0, 0, 0, 0, 0, 0, 3, // from 2001:db8::3
    0x20, 0x01, 0x0d, 0xb8, 0,    0,    0,    0,    0, 0, 0, 0, 0, 0, 0, 4, // to 2001:db8::4
    0x9c, 0x40, 0x1b, 0x58, 0x00, 0x0c, 0x00, 0x00,                         // port 40000 to 7000
    'h',  'i',  '!',  '\n',
};

} // namespace

int main() {
    try {
        netfloor::Host host(netfloor::PluginLibrary::open(PLUGIN_PATH));
        TreeOutput output;
        host.run(netfloor::Pass::md, packet, output);
    } catch (const netfloor::PluginError &error) {
        std::cerr << error.what() << '\n';
        return 1;
    }
}
