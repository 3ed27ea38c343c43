// The fields of one spooled timeline event packed into bytes, and read back in the order they
// were added: integers as eight bytes in native order (a spool never outlives its process),
// texts as their length and their bytes.
#pragma once

#include <cstddef>
#include <cstdint>
#include <cstring>
#include <string>
#include <string_view>

namespace velmora {

class SpoolRecord {
public:
    SpoolRecord& add(int64_t value) {
        mBytes.append(reinterpret_cast<const char*>(&value), sizeof(value));
        return *this;
    }
    SpoolRecord& add(const std::string& text) {
        add(static_cast<int64_t>(text.size()));
        mBytes.append(text);
        return *this;
    }
    const std::string& bytes() const { return mBytes; }

    // Reads the fields of one record in order. Past the end of a record cut short, integers read
    // as 0 and texts as "".
    class Reader {
    public:
        Reader(const char* data, size_t size) : mData(data), mLeft(size) {}

        int64_t integer() {
            int64_t value = 0;
            if (mLeft >= sizeof(value)) {
                memcpy(&value, mData, sizeof(value));
                mData += sizeof(value);
                mLeft -= sizeof(value);
            }
            return value;
        }
        std::string text() { return std::string(view()); }
        // The text in place: valid while the record's bytes are.
        std::string_view view() {
            const int64_t size = integer();
            if (size <= 0 || static_cast<size_t>(size) > mLeft)
                return std::string_view();
            std::string_view out(mData, static_cast<size_t>(size));
            mData += size;
            mLeft -= static_cast<size_t>(size);
            return out;
        }

    private:
        const char* mData;
        size_t mLeft;
    };

private:
    std::string mBytes;
};

}  // namespace velmora
