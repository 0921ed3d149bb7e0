// SPDX-License-Identifier: MIT
// The functions of libpcap that are used, loaded when the first of them is.
#pragma once

#include <pcap/pcap.h>

namespace netfloor {

struct Libpcap {
    decltype(&pcap_open_dead) openDead;
    decltype(&pcap_close) close;
    decltype(&pcap_compile) compile;
    decltype(&pcap_freecode) freeCode;
    decltype(&pcap_geterr) error;
    decltype(&pcap_offline_filter) matches;
    decltype(&pcap_datalink_val_to_description) describe;
};

// None when libpcap is not installed. It stays loaded.
[[nodiscard]] const Libpcap *libpcap();

// libpcap has numbers of its own for some link types.
[[nodiscard]] int libpcapLinkType(int linkType);

} // namespace netfloor
