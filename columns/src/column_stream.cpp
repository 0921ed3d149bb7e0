// SPDX-License-Identifier: MIT
#include "netfloor-columns/column_stream.h"

#include <cerrno>
#include <exception>
#include <memory>
#include <new>
#include <optional>
#include <stdexcept>
#include <string>
#include <utility>

#include "batch.h"
#include "netfloor-analysis/rows.h"
#include "netfloor-capture/capture_file.h"
#include "netfloor-capture/link_layer.h"
#include "netfloor-host/condition.h"
#include "netfloor-host/plugin_host.h"

namespace netfloor {
namespace {

OwnedSchema makeTableSchema(const ColumnScan &scan) {
    SchemaParts parts = {.format = "+s"};
    for (const std::size_t column : wantedColumns(scan)) {
        parts.children.push_back(makeColumnSchema(columns(scan.table)[column], scan.binaryAddresses));
    }
    return makeSchema(std::move(parts));
}

class ColumnReader final : private RowSink {
public:
    explicit ColumnReader(ColumnScan scan)
        : scan_(std::move(scan)),
          batch_(scan_),
          capture_(scan_.shard ? CaptureFile(*scan_.shard, 0) : CaptureFile(scan_.path)),
          host_(PluginLibrary::openCopy(scan_.plugin)),
          rows_(host_) {
        if (!scan_.where.empty()) {
            condition_.emplace(scan_.where);
        }
    }

    [[nodiscard]] OwnedSchema schema() const { return makeTableSchema(scan_); }

    // The next batch, or one without `release` at the end. Throws what ends the reading; again each time.
    [[nodiscard]] OwnedArray next() {
        if (!failure_ && !isAtEnd_) {
            try {
                fill();
            } catch (...) {
                failure_ = std::current_exception();
            }
        }
        if (batch_.rows() != 0) { // also what was read before a failure
            return batch_.finish();
        }
        if (failure_) {
            std::rethrow_exception(failure_);
        }
        return {};
    }

private:
    void fill() {
        CapturedPacket packet;
        while (!batch_.isFull()) {
            if (!capture_.next(packet)) {
                isAtEnd_ = true;
                return;
            }
            readPacket(packet);
        }
    }

    void readPacket(const CapturedPacket &packet) {
        const NetworkPart network = findNetworkPart(packet.linkType, packet.octets);
        if (!network.isIp() && (scan_.table != RowKind::packet || condition_)) {
            return;
        }
        const std::string other = network.other.text();
        rows_.read({packet, network, other}, *this);
    }

    [[nodiscard]] bool wantsChecks() const override { return scan_.table == RowKind::packet; }

    void row(const Row &row) override {
        if (row.kind() == scan_.table && (!condition_ || rows_.holds(*condition_, row))) {
            batch_.add(row);
        }
    }

    ColumnScan scan_;
    Batch batch_;
    CaptureFile capture_;
    Host host_;
    PacketRows rows_;
    std::optional<Condition> condition_;
    std::exception_ptr failure_;
    bool isAtEnd_ = false;
};

struct StreamStorage {
    explicit StreamStorage(const ColumnScan &scan) : reader(scan) {}

    ColumnReader reader;
    std::string error;
};

StreamStorage &storageOf(ArrowArrayStream *stream) {
    return *static_cast<StreamStorage *>(stream->private_data);
}

// No exception may pass through the C interface.
template <typename Step>
int guarded(StreamStorage &storage, Step step) noexcept {
    try {
        storage.error.clear();
        step();
        return 0;
    } catch (const std::bad_alloc &) {
        return ENOMEM;
    } catch (const std::exception &error) {
        try {
            storage.error = error.what();
        } catch (const std::bad_alloc &) {
            return ENOMEM;
        }
        return EIO;
    }
}

int getSchema(ArrowArrayStream *stream, ArrowSchema *out) {
    StreamStorage &storage = storageOf(stream);
    return guarded(storage, [&] { *out = storage.reader.schema().take(); });
}

int getNext(ArrowArrayStream *stream, ArrowArray *out) {
    StreamStorage &storage = storageOf(stream);
    return guarded(storage, [&] { *out = storage.reader.next().take(); });
}

const char *getLastError(ArrowArrayStream *stream) {
    const std::string &error = storageOf(stream).error;
    return error.empty() ? nullptr : error.c_str();
}

void releaseStream(ArrowArrayStream *stream) {
    const std::unique_ptr<StreamStorage> storage(&storageOf(stream));
    stream->release = nullptr;
}

} // namespace

void checkScan(const ColumnScan &scan) {
    static_cast<void>(wantedColumns(scan));
    if (scan.batchRows == 0) {
        throw std::invalid_argument("A batch has at least one row.");
    }
    if (!scan.where.empty()) {
        static_cast<void>(Condition(scan.where));
    }
}

void columnSchema(const ColumnScan &scan, ArrowSchema &out) {
    out = makeTableSchema(scan).take();
}

void openColumns(const ColumnScan &scan, ArrowArrayStream &out) {
    checkScan(scan);
    auto storage = std::make_unique<StreamStorage>(scan);
    out = {&getSchema, &getNext, &getLastError, &releaseStream, storage.release()};
}

} // namespace netfloor
