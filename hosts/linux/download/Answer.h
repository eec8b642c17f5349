#ifndef TALO_HOSTS_LINUX_DOWNLOAD_ANSWER_H
#define TALO_HOSTS_LINUX_DOWNLOAD_ANSWER_H

#include <sys/stat.h>

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

#include "hosts/linux/download/Conditions.h"
#include "hosts/linux/download/Ranges.h"

namespace host {

// What counts of a request for a content.
struct ContentRequest {
    std::string method;
    std::optional<std::string> range;
    ConditionHeaders conditions;

    // Conditions and ranges mean something for GET and HEAD alone: the answer to
    // a POST is no copy of what the client has.
    bool MayBeConditional() const {
        return method == "GET" || method == "HEAD";
    }
};

// The request of this process, out of the CGI environment.
ContentRequest CurrentRequest();

// What is to be sent.
struct Content {
    std::string mimeType;     // checked
    std::string disposition;  // value of Content-Disposition, "" for none
    uint64_t size = 0;
    Validators validators;
};

// What tells the states of this file apart, the content beginning at a place in
// it. The tag takes in the time of the last change of the file's record, which
// nobody can set back, so that a file that got its old time and size again is
// another one all the same.
Validators ValidatorsOf(const struct stat& facts, uint64_t start);

// A range of the content with the text that goes out in front of it.
struct Piece {
    std::string before;
    ByteRange range;
};

// Everything that goes out. The header ends with the blank line.
struct Answer {
    std::string header;
    std::vector<Piece> pieces;
    std::string after;
};

// The answer to a request for a content of known size.
Answer AnswerFor(const ContentRequest& request, const Content& content, time_t now);

// The header of a content of unknown size.
std::string StreamHeader(const Content& content);

// The header of a content that the web server sends; `line` tells it which.
std::string RedirectHeader(const Content& content, const std::string& line);

// A whole answer that says what is wrong: 403, 404 or 500.
std::string ErrorAnswer(const ContentRequest& request, int status);

}  // namespace host

#endif
