#include "tools/logcat/LogcatFormat.h"

#include <cstring>

namespace velmora {

namespace {

constexpr int64_t kUsPerSecond = 1000000;
// Stamps of seconds from this value on are wall-clock time (2001 onwards), below it the time
// since boot: no device has been up for 31 years.
constexpr int64_t kEpochFromUs = 1000000000LL * kUsPerSecond;
// The year assumed when the stamps have none; a leap year, so that 02-29 is a valid date.
constexpr int kYearWithoutYear = 2000;
constexpr const char* kPriorities = "VDIWEFS";

bool isDigit(char c) {
    return c >= '0' && c <= '9';
}

void skipSpaces(const char** p) {
    while (**p == ' ')
        ++*p;
}

// Reads `min` to `max` decimal digits.
bool readDigits(const char** p, int min, int max, int64_t* value, int* count = nullptr) {
    int n = 0;
    int64_t v = 0;
    while (n < max && isDigit((*p)[n])) {
        v = v * 10 + ((*p)[n] - '0');
        ++n;
    }
    if (n < min || isDigit((*p)[n]))
        return false;
    *p += n;
    *value = v;
    if (count != nullptr)
        *count = n;
    return true;
}

bool expect(const char** p, char c) {
    if (**p != c)
        return false;
    ++*p;
    return true;
}

// A fraction of a second of 3 (msec) to 9 (nsec) digits, in microseconds.
bool readFraction(const char** p, int64_t* us) {
    int64_t v = 0;
    int digits = 0;
    if (!expect(p, '.') || !readDigits(p, 3, 9, &v, &digits))
        return false;
    for (; digits < 6; ++digits)
        v *= 10;
    for (; digits > 6; --digits)
        v /= 10;
    *us = v;
    return true;
}

// Days since 1970-01-01 of a civil date (proleptic Gregorian calendar).
int64_t daysFromCivil(int64_t y, int64_t m, int64_t d) {
    y -= m <= 2 ? 1 : 0;
    const int64_t era = (y >= 0 ? y : y - 399) / 400;
    const int64_t yoe = y - era * 400;
    const int64_t doy = (153 * (m + (m > 2 ? -3 : 9)) + 2) / 5 + d - 1;
    const int64_t doe = yoe * 365 + yoe / 4 - yoe / 100 + doy;
    return era * 146097 + doe - 719468;
}

// A user name or uid followed by ':' ("root:", "1000:").
bool readUid(const char** p) {
    skipSpaces(p);
    const char* start = *p;
    while (**p != '\0' && **p != ':' && **p != ' ' && **p != ')')
        ++*p;
    return *p != start && expect(p, ':');
}

bool readPriority(const char** p, char* priority) {
    if (**p == '\0' || strchr(kPriorities, **p) == nullptr)
        return false;
    *priority = **p;
    ++*p;
    return true;
}

std::string trimRight(std::string text) {
    while (!text.empty() && (text.back() == ' ' || text.back() == '\r' || text.back() == '\n'))
        text.pop_back();
    return text;
}

}  // namespace

bool LogcatFormat::parseStamp(const char** p, int64_t* timeUs) const {
    int64_t fraction = 0;
    if (mClock != Clock::kDate) {
        int64_t seconds = 0;
        skipSpaces(p);
        if (!readDigits(p, 1, 12, &seconds) || !readFraction(p, &fraction))
            return false;
        *timeUs = seconds * kUsPerSecond + fraction;
        return true;
    }
    int64_t year = kYearWithoutYear, month = 0, day = 0, hour = 0, minute = 0, second = 0;
    if (mYear && !(readDigits(p, 4, 4, &year) && expect(p, '-')))
        return false;
    if (!(readDigits(p, 2, 2, &month) && expect(p, '-') && readDigits(p, 2, 2, &day) &&
          expect(p, ' ') && readDigits(p, 2, 2, &hour) && expect(p, ':') &&
          readDigits(p, 2, 2, &minute) && expect(p, ':') && readDigits(p, 2, 2, &second) &&
          readFraction(p, &fraction)))
        return false;
    if (month < 1 || month > 12 || day < 1 || day > 31 || hour > 23 || minute > 59 || second > 60)
        return false;
    const int64_t seconds =
        ((daysFromCivil(year, month, day) * 24 + hour) * 60 + minute) * 60 + second;
    *timeUs = seconds * kUsPerSecond + fraction;
    return true;
}

// "  1000:  1234  1250 I velmora server: text" after the stamp.
bool LogcatFormat::parseThreadTime(const char* p, LogcatRecord* record) const {
    int64_t pid = 0, tid = 0;
    if (!expect(&p, ' ') || (mUid && !readUid(&p)))
        return false;
    skipSpaces(&p);
    if (!readDigits(&p, 1, 10, &pid) || !expect(&p, ' '))
        return false;
    skipSpaces(&p);
    if (!readDigits(&p, 1, 10, &tid) || !expect(&p, ' ') || !readPriority(&p, &record->priority) ||
        !expect(&p, ' '))
        return false;
    const std::string rest(p);
    size_t colon = rest.find(": ");
    if (colon == std::string::npos) {
        if (rest.empty() || rest.back() != ':')
            return false;
        colon = rest.size() - 1;  // an empty message
    }
    record->pid = static_cast<int>(pid);
    record->tid = static_cast<int>(tid);
    record->tag = trimRight(rest.substr(0, colon));
    record->message = trimRight(rest.substr(std::min(rest.size(), colon + 2)));
    return !record->tag.empty();
}

// " I/velmora server( 1000: 1234): text" after the stamp.
bool LogcatFormat::parseTime(const char* p, LogcatRecord* record) const {
    if (!expect(&p, ' '))
        return false;
    skipSpaces(&p);
    if (!readPriority(&p, &record->priority) || !expect(&p, '/'))
        return false;
    const std::string rest(p);
    size_t close = rest.find("): ");
    if (close == std::string::npos) {
        if (rest.size() < 2 || rest.compare(rest.size() - 2, 2, "):") != 0)
            return false;
        close = rest.size() - 2;  // an empty message
    }
    const size_t open = rest.rfind('(', close);
    if (open == std::string::npos)
        return false;
    const std::string inner = rest.substr(open + 1, close - open - 1);
    const char* q = inner.c_str();
    int64_t pid = 0;
    if (mUid && !readUid(&q))
        return false;
    skipSpaces(&q);
    if (!readDigits(&q, 1, 10, &pid) || *q != '\0')
        return false;
    record->pid = static_cast<int>(pid);
    record->tid = -1;
    record->tag = trimRight(rest.substr(0, open));
    record->message = trimRight(rest.substr(std::min(rest.size(), close + 3)));
    return !record->tag.empty();
}

bool LogcatFormat::parse(const std::string& line, LogcatRecord* record) const {
    const char* p = line.c_str();
    if (!parseStamp(&p, &record->timeUs))
        return false;
    return mLayout == Layout::kThreadTime ? parseThreadTime(p, record) : parseTime(p, record);
}

bool LogcatFormat::detect(const std::string& line, LogcatFormat* format) {
    for (Layout layout : {Layout::kThreadTime, Layout::kTime}) {
        for (int stamp = 0; stamp < 3; ++stamp) {  // date with year, date, seconds
            for (bool uid : {false, true}) {
                LogcatFormat candidate;
                candidate.mLayout = layout;
                candidate.mClock = stamp == 2 ? Clock::kEpoch : Clock::kDate;
                candidate.mYear = stamp == 0;
                candidate.mUid = uid;
                LogcatRecord record;
                if (!candidate.parse(line, &record))
                    continue;
                if (stamp == 2 && record.timeUs < kEpochFromUs)
                    candidate.mClock = Clock::kMonotonic;
                *format = candidate;
                return true;
            }
        }
    }
    return false;
}

std::string LogcatFormat::name() const {
    std::string name = mLayout == Layout::kThreadTime ? "threadtime" : "time";
    if (mYear)
        name += ",year";
    if (mClock == Clock::kEpoch)
        name += ",epoch";
    if (mClock == Clock::kMonotonic)
        name += ",monotonic";
    if (mUid)
        name += ",uid";
    return name;
}

}  // namespace velmora
