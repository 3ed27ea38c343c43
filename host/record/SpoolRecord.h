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
    SpoolRecord() = default;
    SpoolRecord(const SpoolRecord&) = delete;
    SpoolRecord& operator=(const SpoolRecord&) = delete;

    SpoolRecord& add(int64_t value) {
        append(reinterpret_cast<const char*>(&value), sizeof(value));
        return *this;
    }
    SpoolRecord& add(std::string_view text) {
        add(static_cast<int64_t>(text.size()));
        append(text.data(), text.size());
        return *this;
    }
    std::string_view bytes() const {
        return mLarge.empty() ? std::string_view(mSmall, mSize) : std::string_view(mLarge);
    }

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
    // Most records fit the inline buffer: one is made for every server counter and slice.
    void append(const char* data, size_t size) {
        if (mLarge.empty() && mSize + size <= sizeof(mSmall)) {
            memcpy(mSmall + mSize, data, size);
            mSize += size;
            return;
        }
        if (mLarge.empty())
            mLarge.assign(mSmall, mSize);
        mLarge.append(data, size);
    }

    char mSmall[192];
    size_t mSize = 0;
    std::string mLarge;  // the bytes, once they outgrow mSmall
};

}  // namespace velmora
