// SPDX-License-Identifier: MIT
#include "libpcap.h"

#include <array>
#include <optional>

#include <dlfcn.h>

namespace netfloor {

namespace {

template <typename Function>
bool find(void *library, const char *name, Function &function) {
    function = reinterpret_cast<Function>(::dlsym(library, name));
    return function != nullptr;
}

std::optional<Libpcap> load() {
    // Debian and its derivatives use a name of their own; both names mean the same ABI.
    for (const char *const name : {"libpcap.so.0.8", "libpcap.so.1"}) {
        void *const library = ::dlopen(name, RTLD_LAZY | RTLD_LOCAL);
        if (library == nullptr) {
            continue;
        }
        Libpcap found{};
        if (find(library, "pcap_open_dead", found.openDead) && find(library, "pcap_close", found.close) &&
            find(library, "pcap_compile", found.compile) && find(library, "pcap_freecode", found.freeCode) &&
            find(library, "pcap_geterr", found.error) && find(library, "pcap_offline_filter", found.matches) &&
            find(library, "pcap_datalink_val_to_description", found.describe)) {
            return found;
        }
    }
    return std::nullopt;
}

struct Numbers {
    int inFiles;
    int inLibpcap;
};

constexpr std::array renumbered = {
    Numbers{100, DLT_ATM_RFC1483}, Numbers{101, DLT_RAW},      Numbers{102, DLT_SLIP_BSDOS},
    Numbers{103, DLT_PPP_BSDOS},   Numbers{106, DLT_ATM_CLIP},
};

} // namespace

const Libpcap *libpcap() {
    static const std::optional<Libpcap> loaded = load();
    return loaded ? &*loaded : nullptr;
}

int libpcapLinkType(int linkType) {
    for (const Numbers &row : renumbered) {
        if (row.inFiles == linkType) {
            return row.inLibpcap;
        }
    }
    return linkType;
}

} // namespace netfloor
