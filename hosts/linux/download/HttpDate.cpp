#include "hosts/linux/download/HttpDate.h"

#include <cstdio>
#include <cstring>

namespace host {

namespace {

// strftime and strptime would use the language of the process.
const char* const kDays[] = {"Sun", "Mon", "Tue", "Wed", "Thu", "Fri", "Sat"};
const char* const kLongDays[] = {"Sunday",   "Monday", "Tuesday", "Wednesday",
                                 "Thursday", "Friday", "Saturday"};
const char* const kMonths[] = {"Jan", "Feb", "Mar", "Apr", "May", "Jun",
                               "Jul", "Aug", "Sep", "Oct", "Nov", "Dec"};

// Takes a text apart from left to right; once something does not fit, nothing does.
class Reader {
  public:
    explicit Reader(const std::string& text) : text_(text) {}

    void Skip(const char* expected) {
        const size_t length = std::strlen(expected);
        good_ = good_ && text_.compare(at_, length, expected) == 0;
        at_ += good_ ? length : 0;
    }

    bool TryName(const char* name) {
        const size_t length = std::strlen(name);
        if (!good_ || text_.compare(at_, length, name) != 0) {
            return false;
        }
        at_ += length;
        return true;
    }

    template <size_t count>
    int Name(const char* const (&names)[count]) {
        for (size_t index = 0; index < count; ++index) {
            if (TryName(names[index])) {
                return static_cast<int>(index);
            }
        }
        good_ = false;
        return 0;
    }

    int Number(size_t digits, bool blankPadded = false) {
        int number = 0;
        for (size_t index = 0; index < digits; ++index) {
            const char byte = at_ < text_.size() ? text_[at_] : '\0';
            const bool isDigit = byte >= '0' && byte <= '9';
            good_ = good_ && (isDigit || (blankPadded && index == 0 && byte == ' '));
            number = number * 10 + (isDigit ? byte - '0' : 0);
            ++at_;
        }
        return number;
    }

    void Time(struct tm* parts) {
        parts->tm_hour = Number(2);
        Skip(":");
        parts->tm_min = Number(2);
        Skip(":");
        parts->tm_sec = Number(2);
    }

    bool IsDone() const {
        return good_ && at_ == text_.size();
    }

  private:
    const std::string& text_;
    size_t at_ = 0;
    bool good_ = true;
};

bool ReadFixed(const std::string& text, struct tm* parts) {
    Reader reader(text);
    (void)reader.Name(kDays);
    reader.Skip(", ");
    parts->tm_mday = reader.Number(2);
    reader.Skip(" ");
    parts->tm_mon = reader.Name(kMonths);
    reader.Skip(" ");
    parts->tm_year = reader.Number(4) - 1900;
    reader.Skip(" ");
    reader.Time(parts);
    reader.Skip(" GMT");
    return reader.IsDone();
}

// A year that seems more than 50 years ahead is one of the past.
bool ReadShortYear(const std::string& text, time_t now, struct tm* parts) {
    Reader reader(text);
    (void)reader.Name(kLongDays);
    reader.Skip(", ");
    parts->tm_mday = reader.Number(2);
    reader.Skip("-");
    parts->tm_mon = reader.Name(kMonths);
    reader.Skip("-");
    const int year = reader.Number(2);
    reader.Skip(" ");
    reader.Time(parts);
    reader.Skip(" GMT");
    struct tm today = {};
    if (!reader.IsDone() || gmtime_r(&now, &today) == nullptr) {
        return false;
    }
    const int thisYear = today.tm_year + 1900;
    int full = thisYear - thisYear % 100 + year;
    if (full > thisYear + 50) {
        full -= 100;
    } else if (full <= thisYear - 50) {
        full += 100;
    }
    parts->tm_year = full - 1900;
    return true;
}

bool ReadAsctime(const std::string& text, struct tm* parts) {
    Reader reader(text);
    (void)reader.Name(kDays);
    reader.Skip(" ");
    parts->tm_mon = reader.Name(kMonths);
    reader.Skip(" ");
    parts->tm_mday = reader.Number(2, true);
    reader.Skip(" ");
    reader.Time(parts);
    reader.Skip(" ");
    parts->tm_year = reader.Number(4) - 1900;
    return reader.IsDone();
}

// A second of 60 is a leap second. timegm turns the 30th of February into the
// 2nd of March, by which it is recognised.
bool ToTime(const struct tm& parts, time_t* when) {
    struct tm normal = parts;
    if (parts.tm_hour > 23 || parts.tm_min > 59 || parts.tm_sec > 60) {
        return false;
    }
    normal.tm_sec = 0;
    const time_t minute = timegm(&normal);
    if (normal.tm_mday != parts.tm_mday || normal.tm_mon != parts.tm_mon) {
        return false;
    }
    *when = minute + parts.tm_sec;
    return true;
}

}  // namespace

std::string HttpDate(time_t when) {
    struct tm parts = {};
    if (gmtime_r(&when, &parts) == nullptr || parts.tm_year < -900 || parts.tm_year > 8099) {
        return std::string();
    }
    char text[64];
    (void)std::snprintf(text, sizeof text, "%s, %02d %s %04d %02d:%02d:%02d GMT",
                        kDays[parts.tm_wday], parts.tm_mday, kMonths[parts.tm_mon],
                        parts.tm_year + 1900, parts.tm_hour, parts.tm_min, parts.tm_sec);
    return text;
}

bool ParseHttpDate(const std::string& text, time_t now, time_t* when) {
    struct tm parts = {};
    return (ReadFixed(text, &parts) || ReadShortYear(text, now, &(parts = {})) ||
            ReadAsctime(text, &(parts = {}))) &&
           ToTime(parts, when);
}

}  // namespace host
