#ifndef TALO_PLATFORM_HTTPFILEOUTPUTER_H
#define TALO_PLATFORM_HTTPFILEOUTPUTER_H

#include <cstdio>
#include <string>

#include "platform/Platform.h"

// Writes a file to the client as the rest of an HTTP answer: the content
// headers, the blank line and the content, through the web server's X-Sendfile
// where the environment offers it. Held by value, without state.
//
// The caller has written the answer's other header lines to std::cout or stdout,
// each with its line end and no blank line behind them. They may still lie in a
// buffer: Output writes it out first. Whatever Output answers, a whole answer has
// begun by then; nothing may be written behind it. Where the client is gone or the
// content ended early, it stays cut off.
//
// For GET and HEAD the request's conditions are heard (If-Match,
// If-Unmodified-Since, If-None-Match, If-Modified-Since: 304, 412), for GET also
// Range and If-Range (206, 416); the CGI environment has them. The status is told
// by a header line "Status", so the caller writes none.
class TALO_PLATFORM HTTPFileOutputer {
  public:
    // The MIME type for a file name, by its extension without regard to case;
    // "application/octet-stream" for one that is not known, and without one. Of a
    // path only the last component counts. The file itself is not looked at.
    static std::string GetMimeType(const char* fileName);

    // Sends an open file from its present position to its end; the position is
    // where the content begins, and ranges count from there. The caller keeps the
    // file, its position is then undefined. What is no regular file is sent until it ends,
    // without a length and without ranges. The file is always sent from here, never
    // by the web server.
    //
    // `fileName` is the name, in UTF-8, under which the client is to save the
    // content; "" or null leaves that to the client. `mimeType` may be any text:
    // what is no type becomes "application/octet-stream".
    //
    // 0 when all that belongs to the answer was sent, 304, 412 and 416 included.
    // Negative when the client went away or the content ended early, and for a
    // file that cannot be read: the answer is then a whole one with status 404 (a
    // folder) or 500.
    int Output(FILE* file, const char* fileName, const char* mimeType);

    // The same for a file given by its path, without a download name: a caller
    // who wants one writes the header "Content-Disposition" with the others.
    // Negative, behind a whole answer with status 404, 403 or 500, for a path that
    // is no regular file, that may not be read, or that fails otherwise.
    //
    // The web server may send the file after this process has ended: a caller who
    // removes the file afterwards turns X-Sendfile off before. "/proc/self/fd/N"
    // is a path, too: that of the file that is open there.
    int Output(const char* path, const char* mimeType);
};

#endif
