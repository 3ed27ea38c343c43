#include "host/record/EventSpool.h"

#include <fcntl.h>
#include <unistd.h>

#include <cerrno>
#include <cstdint>
#include <cstdlib>
#include <cstring>

namespace velmora {

namespace {

// Runs `io` (pread or pwrite) until `size` bytes at `offset` are moved; a short transfer goes on
// from where it stopped, an interrupted one is retried. False on an error or an end of file.
template <typename Buffer, typename Io>
bool transferAll(int fd, Buffer* data, size_t size, off_t offset, Io io) {
    while (size > 0) {
        const ssize_t n = io(fd, data, size, offset);
        if (n < 0 && errno == EINTR)
            continue;
        if (n <= 0)
            return false;
        data += n;
        size -= static_cast<size_t>(n);
        offset += n;
    }
    return true;
}

bool writeAll(int fd, const char* data, size_t size, off_t offset) {
    return transferAll(fd, data, size, offset, pwrite);
}

bool readAll(int fd, char* data, size_t size, off_t offset) {
    return transferAll(fd, data, size, offset, pread);
}

}  // namespace

EventSpool::EventSpool(size_t chunkBytes) : mChunkBytes(chunkBytes) {}

EventSpool::~EventSpool() {
    if (mFd >= 0)
        close(mFd);
}

bool EventSpool::openScratch() {
    if (mFd >= 0)
        return true;
    if (mNoScratch)
        return false;
    const char* dir = getenv("TMPDIR");
    std::string path =
        std::string(dir != nullptr && *dir != '\0' ? dir : "/tmp") + "/velmora-timeline-XXXXXX";
    mFd = mkostemp(&path[0], O_CLOEXEC);
    if (mFd < 0) {
        mNoScratch = true;
        return false;
    }
    unlink(path.c_str());
    return true;
}

void EventSpool::flush(Group& group) {
    Chunk chunk;
    chunk.size = group.open.size();
    if (openScratch() && writeAll(mFd, group.open.data(), chunk.size, mFileEnd)) {
        chunk.inFile = true;
        chunk.offset = mFileEnd;
        mFileEnd += static_cast<off_t>(chunk.size);
        group.open.clear();
    } else {
        chunk.kept.swap(group.open);
    }
    group.chunks.push_back(std::move(chunk));
}

void EventSpool::append(size_t group, std::string_view record) {
    if (group >= mGroups.size())
        mGroups.resize(group + 1);
    Group& g = mGroups[group];
    const RecordSize size = static_cast<RecordSize>(record.size());
    if (!g.open.empty() && g.open.size() + sizeof(size) + record.size() > mChunkBytes)
        flush(g);
    if (g.open.capacity() < mChunkBytes)
        g.open.reserve(mChunkBytes);
    g.open.append(reinterpret_cast<const char*>(&size), sizeof(size));
    g.open.append(record);
}

bool EventSpool::forEach(size_t group, const Visitor& visit) const {
    return forEachRecord(group, visit);
}

bool EventSpool::forEachChunk(size_t group, const Visitor& visit) const {
    if (group >= mGroups.size())
        return true;
    const Group& g = mGroups[group];
    std::string buffer;
    for (const Chunk& chunk : g.chunks) {
        if (!chunk.inFile) {
            visit(chunk.kept.data(), chunk.kept.size());
            continue;
        }
        buffer.resize(chunk.size);
        if (!readAll(mFd, &buffer[0], chunk.size, chunk.offset))
            return false;
        visit(buffer.data(), buffer.size());
    }
    visit(g.open.data(), g.open.size());
    return true;
}

void EventSpool::clear() {
    mGroups.clear();
    mFileEnd = 0;
    if (mFd >= 0 && ftruncate(mFd, 0) != 0) {
        close(mFd);  // start a fresh one rather than grow a file that cannot shrink
        mFd = -1;
    }
}

size_t EventSpool::memoryBytes() const {
    size_t bytes = 0;
    for (const Group& g : mGroups) {
        bytes += g.open.size();
        for (const Chunk& chunk : g.chunks)
            bytes += chunk.kept.size();
    }
    return bytes;
}

}  // namespace velmora
