// Records kept out of memory in groups, read back group by group in the order they were appended.
// The timeline puts what it records per call here (server counters and slices, instants, spans),
// so that a replay holds one chunk per group in memory however long it runs: a full chunk goes
// to a scratch file, which is unlinked as soon as it is created and so never left behind. When
// no scratch file can be made or written (no writable $TMPDIR or /tmp, a full disk), the chunks
// stay in memory and nothing is lost.
//
// Not thread safe: the timeline calls it under its own lock.
#pragma once

#include <sys/types.h>

#include <cstddef>
#include <cstdint>
#include <cstring>
#include <functional>
#include <string>
#include <string_view>
#include <vector>

namespace velmora {

class EventSpool {
public:
    static constexpr size_t kChunkBytes = 16 * 1024;

    explicit EventSpool(size_t chunkBytes = kChunkBytes);
    ~EventSpool();
    EventSpool(const EventSpool&) = delete;
    EventSpool& operator=(const EventSpool&) = delete;

    // Appends one record (any bytes) to `group`. Groups are numbered from 0; a group is made on
    // its first record.
    void append(size_t group, std::string_view record);
    // Calls `visit` with each record of `group` in the order appended. False when part of the
    // scratch file could not be read back: the records from there on are missing.
    using Visitor = std::function<void(const char* data, size_t size)>;
    bool forEach(size_t group, const Visitor& visit) const;
    // forEach() with the visitor called directly, for readers that go through millions of
    // records.
    template <typename Visit>
    bool forEachRecord(size_t group, Visit&& visit) const {
        return forEachChunk(group, [&](const char* data, size_t size) {
            size_t at = 0;
            while (at + sizeof(RecordSize) <= size) {
                RecordSize recordSize = 0;
                memcpy(&recordSize, data + at, sizeof(recordSize));
                at += sizeof(recordSize);
                visit(data + at, static_cast<size_t>(recordSize));
                at += recordSize;
            }
        });
    }
    // Forgets every record; the scratch file is kept for the next ones.
    void clear();

    // Bytes of records held in memory, and written to the scratch file.
    size_t memoryBytes() const;
    size_t spooledBytes() const { return static_cast<size_t>(mFileEnd); }

private:
    // A record is its size (native byte order: a spool never outlives its process), then its
    // bytes.
    using RecordSize = uint32_t;

    // Calls `visit` with the bytes of each chunk of `group` in order; false as forEach().
    bool forEachChunk(size_t group, const Visitor& visit) const;

    struct Chunk {
        bool inFile = false;
        off_t offset = 0;  // in the scratch file
        size_t size = 0;
        std::string kept;  // the records themselves when they could not go to the file
    };
    struct Group {
        std::vector<Chunk> chunks;  // full chunks, in order
        std::string open;           // the chunk being filled
    };

    void flush(Group& group);
    bool openScratch();

    size_t mChunkBytes;
    std::vector<Group> mGroups;
    int mFd = -1;
    bool mNoScratch = false;  // making the scratch file failed once: do not try again
    off_t mFileEnd = 0;
};

}  // namespace velmora
