#include <stdlib.h>
#include <string.h>

#include "platform/Cgi.h"
#include "tests/fake/FakePlatform.h"

struct TALOCGIState {};

extern "C" {

int TaloCgiInit(const char*, TALOCGI* ctx) {
    if (fake::Now().Called("TaloCgiInit")) {
        return -1;
    }
    ctx->state = new TALOCGIState();
    ++fake::Now().openContexts;
    return 0;
}

int TaloCgiLoadInCookies(TALOCGI* ctx) {
    if (fake::Now().Called("TaloCgiLoadInCookies") || ctx->state == nullptr) {
        return -1;
    }
    const char* header = getenv("HTTP_COOKIE");
    fake::Now().cookiesRead.push_back(header != nullptr ? header : "");
    return 0;
}

void TaloCgiFree(TALOCGI* ctx) {
    if (ctx == nullptr) {
        return;
    }
    fake::Now().journal.push_back("TaloCgiFree");
    if (ctx->state != nullptr) {
        --fake::Now().openContexts;
    }
    delete ctx->state;
    memset(ctx, 0, sizeof *ctx);
}

int TaloCgiDetectAndDecryptParamLine(char* line) {
    if (fake::Now().Called("TaloCgiDetectAndDecryptParamLine") || line == nullptr) {
        return 0;
    }
    const std::string& deciphered = fake::Now().decipheredLine;
    if (!deciphered.empty() && deciphered.size() <= strlen(line)) {
        strcpy(line, deciphered.c_str());
    }
    return 1;
}

}  // extern "C"
