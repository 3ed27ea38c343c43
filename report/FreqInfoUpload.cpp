#include "report/FreqInfoUpload.h"

#include <sstream>

#include "config/Tags.h"
#include "platform/PlatformImports.h"
#include "platform/VelmoraLog.h"

namespace {

// Device event-log priority and event id of the frequency-limit report.
constexpr int kJankPrio = 3;
constexpr int kJankFreqLimitEvent = 361;

void appendTwoDigits(std::ostringstream& os, int value) {
    if (value < 10) {
        os << '0';
    }
    os << value;
}

void appendField(std::ostringstream& os, int normalized) {
    os << ',';
    if (normalized != FreqInfoUpload::kEmptyField) {
        os << normalized;
    }
}

}  // namespace

FreqInfoUpload::FreqInfoUpload() : mMaxFreq{-1, -1, -1}, mReported(0), mLimitedClients(0) {
    for (FreqClient& c : mClients) {
        init(c);
    }
}

FreqInfoUpload::~FreqInfoUpload() = default;

void FreqInfoUpload::init(FreqClient& c) {
    for (int32_t& freq : c.mFreq) {
        freq = -1;
    }
}

void FreqInfoUpload::updateMaxFreqData(int max2, int max5, int max8) {
    mMaxFreq[0] = max2;
    mMaxFreq[1] = max5;
    mMaxFreq[2] = max8;
}

void FreqInfoUpload::updateOriginFreqData(int clientId, int tagLen, const int* tags,
                                          const int* configs) {
    if (!isValidClient(clientId)) {
        return;
    }
    for (int i = 0; i < tagLen; ++i) {
        if (slotOf(tags[i]) >= 0) {
            saveTags(mClients[clientId - 1], tags[i], configs[i]);
        }
    }
}

void FreqInfoUpload::updateFinalFreqData(int clientId, int tagLen, const int* tags,
                                         const int* configs) {
    // The reporting state covers all clients, so an unknown requester still produces a line.
    (void)clientId;
    int final[kTrackedTags] = {-1, -1, -1};
    for (int i = 0; i < tagLen; ++i) {
        const int slot = slotOf(tags[i]);
        if (slot >= 0) {
            final[slot] = configs[i];
        }
    }
    if (final[0] == -1 && final[1] == -1 && final[2] == -1) {
        return;
    }
    for (int id = 1; id <= kClients; ++id) {
        updateReason(id);
    }
    uploadFreqInfo(final[0], final[1], final[2]);
}

void FreqInfoUpload::updateFreqClient(int clientId, int tag, int value) {
    if (isValidClient(clientId)) {
        saveTags(mClients[clientId - 1], tag, value);
    }
}

void FreqInfoUpload::saveTags(FreqClient& c, int tag, int value) {
    if (tag == VELMORA_TAG_LITTLE_CPU_MAX_FREQ) {
        c.mFreq[0] = value;
    } else if (tag == VELMORA_TAG_BIG_CPU_MAX_FREQ) {
        c.mFreq[1] = value;
    } else {
        c.mFreq[2] = value;
    }
}

void FreqInfoUpload::updateReason(int clientId) {
    if (!isValidClient(clientId)) {
        return;
    }
    if (isFreqClientLimited(clientId)) {
        mLimitedClients |= clientBit(clientId);
    } else {
        mLimitedClients &= ~clientBit(clientId);
    }
}

bool FreqInfoUpload::isFreqClientLimited(int clientId) {
    return isValidClient(clientId) && getClientStatus(mClients[clientId - 1]);
}

bool FreqInfoUpload::getClientStatus(FreqClient& c) {
    for (int slot = 0; slot < kTrackedTags; ++slot) {
        // An unknown maximum (-1) is below every request, so nothing limits on that tag.
        if (c.mFreq[slot] >= 1 && c.mFreq[slot] < mMaxFreq[slot]) {
            return true;
        }
    }
    return false;
}

int FreqInfoUpload::getNormalizedFreq(int value, int max) {
    if (value == 0) {
        return -1;
    }
    if (value == max) {
        return -1;  // unset on both sides, or capped at the top frequency: not limited
    }
    if (value >= 1 && value < max) {
        return value / 1000;
    }
    return kEmptyField;
}

void FreqInfoUpload::uploadFreqInfo(int f2, int f5, int f8) {
    int status;
    if (mReported == 0) {
        if (mLimitedClients == 0) {
            return;
        }
        status = kStatusStart;
        mReported = 1;
    } else if (mLimitedClients == 0) {
        status = kStatusEnd;
        mReported = 0;
    } else {
        status = kStatusContinue;
    }
    const struct tm when = getReportTime(time(nullptr));
    const std::string text = formatFreqInfo(when, status, f2, f5, f8);
    __zklog_jank_print(kJankPrio, kJankFreqLimitEvent, "%s", text.c_str());
}

std::string FreqInfoUpload::formatFreqInfo(const struct tm& when, int status, int f2, int f5,
                                           int f8) {
    std::ostringstream os;
    os << "#ARG1:<" << when.tm_year + 1900;
    appendTwoDigits(os, when.tm_mon + 1);
    appendTwoDigits(os, when.tm_mday);
    appendTwoDigits(os, when.tm_hour);
    appendTwoDigits(os, when.tm_min);
    appendTwoDigits(os, when.tm_sec);
    os << ',' << status;
    appendField(os, getNormalizedFreq(f2, mMaxFreq[0]));
    appendField(os, getNormalizedFreq(f5, mMaxFreq[1]));
    appendField(os, getNormalizedFreq(f8, mMaxFreq[2]));
    os << ',' << mLimitedClients << '>';
    return os.str();
}

struct tm FreqInfoUpload::getReportTime(time_t now) {
    struct tm when = {};
    if (localtime_r(&now, &when) == nullptr) {
        VLOGE("get local time failed!");
        // A fixed date keeps the line parseable; the report itself is still worth sending.
        when = {};
        when.tm_sec = 1;
        when.tm_mday = 1;
    }
    return when;
}

int FreqInfoUpload::slotOf(int tag) {
    switch (tag) {
        case VELMORA_TAG_LITTLE_CPU_MAX_FREQ:
            return 0;
        case VELMORA_TAG_BIG_CPU_MAX_FREQ:
            return 1;
        case VELMORA_TAG_GPU_MAX_FREQ:
            return 2;
        default:
            return -1;
    }
}

uint32_t FreqInfoUpload::clientBit(int clientId) {
    // Client 1 is the most significant of the three bits.
    return 1u << (kClients - clientId);
}
