#include "programs/webapi_server/Scgi.h"

#include <errno.h>
#include <poll.h>
#include <sys/socket.h>

#include <algorithm>
#include <cstdlib>
#include <cstring>
#include <limits>
#include <string_view>

#include "programs/webapi_server/Clock.h"

namespace {

// What 64 bits with a sign hold. Whether there is room for so much is the method's
// business.
constexpr char kMostLength[] = "9223372036854775807";

// nginx announces as the length what it has read of a body that it passes on while it
// comes. By this variable it says how long all of it will be.
constexpr char kWholeLength[] = "WEBAPI_CONTENT_LENGTH=";
constexpr char kLength[] = "CONTENT_LENGTH=";

bool IsDigit(char byte) {
    return byte >= '0' && byte <= '9';
}

// Takes bytes off a connection, never longer than until the end of the time.
class Source {
  public:
    Source(int connection, int milliseconds)
        : connection_(connection), end_(MillisecondsNow() + milliseconds) {}

    // 1 byte or more into `buffer`; 0 when the result tells why there is none.
    size_t Take(char* buffer, size_t size, int flags, ScgiResult* result, std::string* reason) {
        for (;;) {
            const ssize_t count = recv(connection_, buffer, size, flags | MSG_DONTWAIT);
            if (count > 0) {
                return static_cast<size_t>(count);
            }
            if (count == 0) {
                *result = ScgiResult::kGone;
                *reason = "the connection ended within the header block";
                return 0;
            }
            if (errno != EAGAIN && errno != EINTR) {
                *result = ScgiResult::kGone;
                *reason = std::string("the connection broke: ") + strerror(errno);
                return 0;
            }
            if (errno == EAGAIN && !Wait(result, reason)) {
                return 0;
            }
        }
    }

  private:
    bool Wait(ScgiResult* result, std::string* reason) const {
        const long long left = std::max(end_ - MillisecondsNow(), 0LL);
        struct pollfd input = {connection_, POLLIN, 0};
        const long long most = std::numeric_limits<int>::max();
        if (poll(&input, 1, static_cast<int>(std::min(left, most))) == 0 && left == 0) {
            *result = ScgiResult::kTimedOut;
            *reason = "the header block did not come in time";
            return false;
        }
        return true;
    }

    const int connection_;
    const long long end_;
};

ScgiResult Malformed(std::string* reason, const char* text) {
    *reason = text;
    return ScgiResult::kMalformed;
}

// How much to take for the rest of the length's text, the block and its comma, of
// which the first bytes are not of the block.
struct Frame {
    size_t size;
    size_t lead;
};

// The length in front of the block is looked at ahead. Where more of it has to come,
// what is there is taken, so that the next look waits for new bytes.
ScgiResult ReadLength(Source* source, size_t limit, Frame* frame, std::string* reason) {
    size_t value = 0;
    size_t digits = 0;
    bool zero = false;
    for (;;) {
        char ahead[8];
        ScgiResult result = ScgiResult::kRead;
        const size_t seen = source->Take(ahead, sizeof ahead, MSG_PEEK, &result, reason);
        if (seen == 0) {
            return result;
        }
        size_t used = 0;
        for (; used < seen && IsDigit(ahead[used]); ++used) {
            if (zero) {
                return Malformed(reason, "the block's length begins with a zero");
            }
            zero = digits == 0 && ahead[used] == '0';
            ++digits;
            value = value * 10 + static_cast<size_t>(ahead[used] - '0');
            if (value > limit) {
                *reason = "the header block is longer than " + std::to_string(limit) + " bytes";
                return ScgiResult::kTooLarge;
            }
        }
        const bool ended = used < seen;
        if (ended && (ahead[used] != ':' || digits == 0)) {
            return Malformed(reason, "the block's length is no number");
        }
        if (ended) {
            frame->lead = used + 1;
            frame->size = frame->lead + value + 1;
            return ScgiResult::kRead;
        }
        if (source->Take(ahead, used, 0, &result, reason) != used) {
            return result == ScgiResult::kRead ? Malformed(reason, "somebody else reads along")
                                               : result;
        }
    }
}

bool IsName(std::string_view name) {
    return !name.empty() && std::none_of(name.begin(), name.end(), [](char byte) {
        const auto code = static_cast<unsigned char>(byte);
        return byte == '=' || code < 0x20 || code == 0x7f;
    });
}

bool IsLength(std::string_view value) {
    constexpr size_t kMostDigits = sizeof kMostLength - 1;
    return !value.empty() && std::all_of(value.begin(), value.end(), IsDigit) &&
           (value.size() < kMostDigits || (value.size() == kMostDigits && value <= kMostLength));
}

std::string ValueOf(const std::string& variable) {
    return variable.substr(variable.find('=') + 1);
}

// The whole length, where there is one, takes the place of the announced one.
ScgiResult SettleLength(std::vector<std::string>* variables, std::string* reason) {
    const auto isWhole = [](const std::string& variable) {
        return variable.rfind(kWholeLength, 0) == 0;
    };
    const auto whole = std::find_if(variables->begin(), variables->end(), isWhole);
    if (whole == variables->end()) {
        return ScgiResult::kRead;
    }
    if (std::find_if(whole + 1, variables->end(), isWhole) != variables->end()) {
        return Malformed(reason, "WEBAPI_CONTENT_LENGTH is there twice");
    }
    const std::string length = ValueOf(*whole);
    if (!IsLength(length)) {
        return Malformed(reason, "WEBAPI_CONTENT_LENGTH is no number");
    }
    const std::string announced = ValueOf(variables->front());
    if (std::strtoll(length.c_str(), nullptr, 10) < std::strtoll(announced.c_str(), nullptr, 10)) {
        return Malformed(reason, "WEBAPI_CONTENT_LENGTH is less than CONTENT_LENGTH");
    }
    variables->erase(whole);
    variables->front() = kLength + length;
    return ScgiResult::kRead;
}

// The piece that begins there, up to its NUL; `at` moves behind it.
bool NextPiece(std::string_view block, size_t* at, std::string_view* piece) {
    const size_t end = block.find('\0', *at);
    if (end == std::string_view::npos) {
        return false;
    }
    *piece = block.substr(*at, end - *at);
    *at = end + 1;
    return true;
}

std::string Variable(std::string_view name, std::string_view value) {
    std::string variable;
    variable.reserve(name.size() + 1 + value.size());
    return variable.append(name).append(1, '=').append(value);
}

// Repeated names are left as they come, but for the two that frame the request:
// clients may repeat a header of their own.
ScgiResult ParseBlock(std::string_view block, std::vector<std::string>* variables,
                      std::string* reason) {
    constexpr size_t kUsualCount = 32;
    std::vector<std::string> found;
    found.reserve(kUsualCount);
    bool hasVersion = false;
    for (size_t at = 0; at < block.size();) {
        std::string_view name;
        std::string_view value;
        if (!NextPiece(block, &at, &name) || !NextPiece(block, &at, &value)) {
            return Malformed(reason, "a variable is cut off");
        }
        if (!IsName(name)) {
            return Malformed(reason, "a variable's name is impossible");
        }
        const bool isLength = name == "CONTENT_LENGTH";
        if (isLength != found.empty()) {
            return Malformed(reason, "CONTENT_LENGTH is not the first variable, and once");
        }
        if (isLength && !IsLength(value)) {
            return Malformed(reason, "CONTENT_LENGTH is no number");
        }
        if (name == "SCGI") {
            if (hasVersion || value != "1") {
                return Malformed(reason, "SCGI is not 1, and once");
            }
            hasVersion = true;
        }
        found.push_back(Variable(name, value));
    }
    if (!hasVersion) {
        return Malformed(reason, found.empty() ? "there are no variables" : "SCGI is missing");
    }
    const ScgiResult result = SettleLength(&found, reason);
    if (result == ScgiResult::kRead) {
        variables->swap(found);
    }
    return result;
}

}  // namespace

ScgiResult ReadScgiRequest(int connection, const ScgiLimits& limits,
                           std::vector<std::string>* variables, std::string* reason) {
    Source source(connection, limits.milliseconds);
    Frame frame = {};
    ScgiResult result = ReadLength(&source, limits.headerBytes, &frame, reason);
    if (result != ScgiResult::kRead) {
        return result;
    }
    std::string block(frame.size, '\0');
    for (size_t have = 0; have < block.size();) {
        const size_t count = source.Take(&block[have], block.size() - have, 0, &result, reason);
        if (count == 0) {
            return result;
        }
        have += count;
    }
    if (block.back() != ',') {
        return Malformed(reason, "no comma follows the block");
    }
    const std::string_view inner(block.data() + frame.lead, block.size() - frame.lead - 1);
    return ParseBlock(inner, variables, reason);
}
