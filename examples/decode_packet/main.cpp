// SPDX-License-Identifier: MIT
// Decodes one packet in each of the four passes, with an owner for the layer above UDP.
#include <cstdint>
#include <iostream>
#include <string>

#include <netfloor-host/plugin_host.h>

namespace {

constexpr std::uint8_t packet[] = {
    0x45, 0x00, 0x00, 0x29, 0x12, 0x34, 0x00, 0x00, // IPv4, 41 octets
    0x40, 0x11, 0x00, 0x00, 0x0a, 0x00, 0x00, 0x01, // UDP, from 10.0.0.1
    0xc0, 0xa8, 0x00, 0x02,                         // to 192.168.0.2
    0x9c, 0x40, 0x1b, 0x58, 0x00, 0x15, 0x00, 0x00, // port 40000 to 7000
    'h',  'e',  'l',  'l',  'o',  ',',  ' ',  'w',  'o', 'r', 'l', 'd', '!',
};

// The owner of port 7000: its payload is a line of text.
netfloor::Handled takeText(netfloor::NextLayer &next) {
    const std::string text(next.payload().begin(), next.payload().end());
    next.layer(7000, [&] { next.take(next.bitsLeft(), "text", "Text=" + text, text); });
    return netfloor::Handled::yes;
}

void decode(netfloor::Host &host) {
    using netfloor::Pass;

    std::cout << "fields:\n";
    const netfloor::Report fields = host.run(Pass::md, packet);
    for (const netfloor::FieldReport &field : fields.fields) {
        std::cout << "  " << fields.path(field) << ": " << field.text << '\n';
    }
    std::cout << "in short:";
    for (const netfloor::DisplayReport &display : host.run(Pass::to, packet).displays) {
        std::cout << ' ' << display.text << ';';
    }
    const netfloor::Report verdict = host.run(Pass::mv, packet);
    std::cout << "\nverdict: " << (verdict.verdict.fault() ? "fault" : "sound") << "\nkeys:\n";
    for (const netfloor::KeyValue &key : host.run(Pass::xtr, packet).keys) {
        std::cout << "  " << key.name << ": " << netfloor::keyText(key) << '\n';
    }
}

} // namespace

int main() {
    try {
        netfloor::Host host(netfloor::PluginLibrary::open(PLUGIN_PATH));
        host.owners().add(7000, takeText);
        decode(host);
    } catch (const netfloor::PluginError &error) {
        std::cerr << error.what() << '\n';
        return 1;
    }
}
