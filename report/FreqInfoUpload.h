// Frequency statistics reporter: writes a device event-log line whenever a frequency client's
// merged CPU/GPU caps change while some client holds, or has just released, a cap below the
// hardware maximum.
//
// Owns the last requested caps of clients 1..3 for tags 2, 5 and 8, the hardware maxima of those
// tags and the reporting state. FreqClientManager holds it by value and is its only caller; it
// has no lock of its own: REQUIRES the manager's mLock for every call. Only the destructor is
// virtual; the layout is shared with separately built components.
#pragma once

#include <time.h>

#include <cstdint>
#include <string>

class FreqInfoUpload {
public:
    // Tracked tags in slot order: little cpu max (2), big cpu max (5), gpu max (8).
    static constexpr int kTrackedTags = 3;
    static constexpr int kClients = 3;
    // getNormalizedFreq's answer for a field that is left empty in the report.
    static constexpr int kEmptyField = 2147483647;

    // Report statuses written as the second field.
    static constexpr int kStatusStart = 1;
    static constexpr int kStatusEnd = 2;
    static constexpr int kStatusContinue = 3;

    struct FreqClient {
        int32_t mFreq[kTrackedTags];  // -1 unset
    };

    FreqInfoUpload();
    virtual ~FreqInfoUpload();

    // Marks every slot of `c` unset.
    void init(FreqClient& c);
    // Hardware maxima of tags 2, 5 and 8 (-1 unknown: nothing counts as limiting on that tag).
    void updateMaxFreqData(int max2, int max5, int max8);
    // Records a client's own requested values of tags 2, 5, 8; other tags and ids are ignored.
    void updateOriginFreqData(int clientId, int tagLen, const int* tags, const int* configs);
    // Takes the merged values sent to the platform and writes a report line when the reporting
    // state says so.
    void updateFinalFreqData(int clientId, int tagLen, const int* tags, const int* configs);
    // Stores one value for clients 1..3: tag 2 first slot, 5 second, any other third.
    void updateFreqClient(int clientId, int tag, int value);
    // Same slot rule on a given record.
    void saveTags(FreqClient& c, int tag, int value);
    // Recomputes the client's bit in mLimitedClients without reporting.
    void updateReason(int clientId);
    // True when the client (1..3) holds a cap below the hardware maximum.
    bool isFreqClientLimited(int clientId);
    // Same test on a given record.
    bool getClientStatus(FreqClient& c);
    // Report value of `value` against `max`: MHz, -1 for "not limited", or kEmptyField.
    int getNormalizedFreq(int value, int max);
    // Advances the reporting state and writes one line unless nothing is or was limiting.
    void uploadFreqInfo(int f2, int f5, int f8);

    // The report line for `status` at local time `when`, from the current maxima and client bits.
    std::string formatFreqInfo(const struct tm& when, int status, int f2, int f5, int f8);
    // Local time of `now`; on failure logs and answers 1900-01-01 00:00:01.
    static struct tm getReportTime(time_t now);

    FreqClient mClients[kClients];   // clients 1, 2, 3 in that order
    int32_t mMaxFreq[kTrackedTags];  // -1 until read from the platform
    int32_t mReported;               // 1 while the last line said some client was limiting
    uint32_t mLimitedClients;        // client 1: 4, client 2: 2, client 3: 1

private:
    // Slot of a tracked tag, or -1 for any other tag.
    static int slotOf(int tag);
    static uint32_t clientBit(int clientId);
    static bool isValidClient(int clientId) { return clientId >= 1 && clientId <= kClients; }
};
