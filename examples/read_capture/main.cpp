// SPDX-License-Identifier: MIT
// Reads a capture and prints for each packet its position in the file, its time and the plug-in's verdict.
#include <exception>
#include <iostream>

#include <netfloor-capture/capture_file.h>
#include <netfloor-capture/link_layer.h>
#include <netfloor-capture/time_text.h>
#include <netfloor-host/plugin_host.h>

namespace {

void readCapture(const char *path) {
    netfloor::Host host(netfloor::PluginLibrary::open(PLUGIN_PATH));
    netfloor::CaptureFile capture(path);
    netfloor::TimeText times(netfloor::TimeForm::utc);
    netfloor::CapturedPacket packet;
    while (capture.next(packet)) {
        std::cout << packet.number << " at octet " << packet.position << ", " << times.text(packet) << ", "
                  << netfloor::linkTypeName(packet.linkType) << ": ";
        const netfloor::NetworkPart network = netfloor::findNetworkPart(packet.linkType, packet.octets);
        if (!network.isIp()) {
            std::cout << network.other.text() << '\n';
            continue;
        }
        const netfloor::Report report = host.run(netfloor::Pass::mv, network.octets);
        std::cout << network.octets.size() << " octets of IP, " << (report.verdict.fault() ? "fault" : "sound") << '\n';
    }
}

} // namespace

int main(int argumentCount, char **arguments) {
    if (argumentCount != 2) {
        std::cerr << "usage: read_capture FILE\n";
        return 2;
    }
    try {
        readCapture(arguments[1]);
    } catch (const std::exception &error) { // damage is thrown after the whole packets before it
        std::cout.flush();
        std::cerr << error.what() << '\n';
        return 1;
    }
}
