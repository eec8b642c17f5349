#ifndef TALO_PLATFORM_HTTPFILEOUTPUTER_H
#define TALO_PLATFORM_HTTPFILEOUTPUTER_H

#include <cstdio>
#include <string>

#include "platform/Platform.h"

// Writes a file to the client as the rest of an HTTP answer: the content
// headers, the blank line and the content, through the web server's X-Sendfile
// where the environment offers it. Held by value, without state.
class TALO_PLATFORM HTTPFileOutputer {
  public:
    // The MIME type for a file name, by its extension; "application/octet-stream"
    // for one that is not known.
    static std::string GetMimeType(const char* fileName);

    // Sends an open file from its present position; `fileName` may be empty. The
    // caller keeps the file. 0 on success, negative otherwise.
    int Output(FILE* file, const char* fileName, const char* mimeType);

    // The same for a file given by its path.
    int Output(const char* path, const char* mimeType);
};

#endif
