// SPDX-License-Identifier: MIT
// pcap files, read by libpcap.
#include <cstdio>
#include <string>

#include <pcap/pcap.h>

#include "capture/capture.h"

namespace netfloor::cli {

namespace {

ssize_t readCookie(void *cookie, char *octets, size_t size) {
    auto *const stream = static_cast<OctetStream *>(cookie);
    return static_cast<ssize_t>(stream->read({reinterpret_cast<std::uint8_t *>(octets), size}));
}

// Tells the position only, which is all that ftello() asks for.
int seekCookie(void *cookie, off64_t *offset, int whence) {
    if (whence != SEEK_CUR || *offset != 0) {
        return -1;
    }
    *offset = static_cast<off64_t>(static_cast<OctetStream *>(cookie)->position());
    return 0;
}

class PcapReader final : public CaptureReader {
public:
    explicit PcapReader(OctetStream &stream) : stream_(stream) {
        const auto magic = stream.peek(4);
        timeDigits_ = magic[0] == 0x4d || magic[3] == 0x4d ? 9 : 6;

        std::FILE *const file = fopencookie(&stream, "rb", {readCookie, nullptr, seekCookie, nullptr});
        if (file == nullptr) {
            throw CaptureError(stream.name() + ": there is not enough memory to read it.");
        }
        if (stream.isLive()) {
            // A buffer would hold packets back until it is full.
            std::setvbuf(file, nullptr, _IONBF, 0);
        }
        char reason[PCAP_ERRBUF_SIZE] = {};
        capture_ = pcap_fopen_offline_with_tstamp_precision(file, PCAP_TSTAMP_PRECISION_NANO, reason);
        if (capture_ == nullptr) {
            std::fclose(file);
            throw CaptureError(stream.name() + " has no usable capture header: " + reason +
                               ". Take the capture again, or name another file.");
        }
        linkType_ = pcap_datalink(capture_);
    }

    ~PcapReader() override { pcap_close(capture_); }

    bool next(CapturedPacket &packet) override {
        const off_t firstOctet = ftello(pcap_file(capture_));
        pcap_pkthdr *header = nullptr;
        const u_char *octets = nullptr;
        const int result = pcap_next_ex(capture_, &header, &octets);
        if (result == PCAP_ERROR_BREAK && stream_.error().empty()) {
            return false;
        }
        if (result != 1) {
            throw damage(static_cast<std::uint64_t>(firstOctet));
        }
        ++number_;
        packet.number = number_;
        packet.time = CaptureTime{header->ts.tv_sec, static_cast<std::uint32_t>(header->ts.tv_usec)};
        packet.linkType = linkType_;
        packet.wireOctets = header->len;
        packet.octets = {octets, header->caplen};
        return true;
    }

    [[nodiscard]] int timeDigits() const override { return timeDigits_; }

private:
    [[nodiscard]] CaptureDamage damage(std::uint64_t firstOctet) {
        if (!stream_.error().empty()) {
            return damageAt(stream_, number_ + 1, firstOctet, stream_.error());
        }
        if (std::feof(pcap_file(capture_)) != 0) {
            return damageAt(stream_, number_ + 1, firstOctet,
                            "the capture is cut off at octet " + std::to_string(stream_.position()) + ",");
        }
        return damageAt(stream_, number_ + 1, firstOctet,
                        std::string("the capture is damaged (") + pcap_geterr(capture_) + ")");
    }

    OctetStream &stream_;
    pcap_t *capture_ = nullptr;
    int linkType_ = 0;
    int timeDigits_ = 6;
    std::uint64_t number_ = 0;
};

} // namespace

std::unique_ptr<CaptureReader> openPcap(OctetStream &stream) {
    return std::make_unique<PcapReader>(stream);
}

} // namespace netfloor::cli
