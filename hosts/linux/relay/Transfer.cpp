#include "hosts/linux/relay/Transfer.h"

#include <sys/socket.h>

#include <algorithm>
#include <cstring>

namespace host {

namespace {

constexpr long kStatusOk = 200;
constexpr long kStatusFinal = 200;  // those below only announce another
constexpr long kStatusRefused = 300;

constexpr long kConnectMilliseconds = 10000;
constexpr long kKeepAliveSeconds = 30;
constexpr long long kMostHeaderBytes = 64 << 10;
constexpr long kMostSeconds = 366L * 24 * 3600;

constexpr char kUserAgent[] = "webapi-relay/1";
constexpr char kRequestErrorHeader[] = "x-request-error:";
// The only encoding of a transfer that is spoken; libcurl refuses all others.
constexpr char kEncodingHeader[] = "transfer-encoding:";

template <typename Value>
bool Set(CURL* easy, CURLoption option, Value value) {
    return curl_easy_setopt(easy, option, value) == CURLE_OK;
}

// libcurl's own sockets would stay open in a program that this one starts.
curl_socket_t OpenSocket(void*, curlsocktype, struct curl_sockaddr* address) {
    return socket(address->family, address->socktype | SOCK_CLOEXEC, address->protocol);
}

const char* TextOrNull(const char* text) {
    return *text != '\0' ? text : nullptr;
}

char LowerCase(char byte) {
    return byte >= 'A' && byte <= 'Z' ? static_cast<char>(byte - 'A' + 'a') : byte;
}

bool HasPrefix(const char* line, size_t size, const char* prefix) {
    const size_t length = strlen(prefix);
    return size >= length && std::equal(prefix, prefix + length, line, [](char left, char right) {
               return left == LowerCase(right);
           });
}

bool IsBlank(char byte) {
    return byte == ' ' || byte == '\t' || byte == '\r' || byte == '\n';
}

}  // namespace

Transfer::Transfer(TaloRelayCall* call)
    : call_(call), start_(Clock::now()), easy_(curl_easy_init()) {}

Transfer::~Transfer() = default;

void Transfer::Reset() {
    call_->status = 0;
    call_->requestError[0] = '\0';
    call_->problem[0] = '\0';
    curl_easy_reset(easy_.get());
    headers_.reset();
    body_.reset();
    chunks_.reset();
    requested_ = reached_ = waits_ = headersDone_ = bodyCut_ = tooLong_ = notTaken_ = false;
    headerBytes_ = received_ = 0;
}

// A body of several megabytes would otherwise be asked for first, and wait a
// second for a server that does not answer that.
bool Transfer::AddHeaders() {
    static const char* const kNone[] = {nullptr};
    headers_.reset(curl_slist_append(nullptr, "Expect:"));
    for (const char* const* line = call_->headers != nullptr ? call_->headers : kNone;
         headers_ != nullptr && *line != nullptr; ++line) {
        curl_slist* longer = curl_slist_append(headers_.get(), *line);
        if (longer == nullptr) {
            return false;
        }
    }
    return headers_ != nullptr && Set(easy_.get(), CURLOPT_HTTPHEADER, headers_.get());
}

// False when the time is over already.
bool Transfer::SetLimits() {
    CURL* easy = easy_.get();
    if (call_->seconds > 0) {
        const long long most = 1000LL * std::min(call_->seconds, kMostSeconds);
        const auto gone =
            std::chrono::duration_cast<std::chrono::milliseconds>(Clock::now() - start_).count();
        if (gone >= most || !Set(easy, CURLOPT_TIMEOUT_MS, static_cast<long>(most - gone))) {
            return false;
        }
    }
    return Set(easy, CURLOPT_CONNECTTIMEOUT_MS, kConnectMilliseconds) &&
           Set(easy, CURLOPT_MAXFILESIZE_LARGE, static_cast<curl_off_t>(call_->most)) &&
           Set(easy, CURLOPT_TCP_KEEPALIVE, 1L) &&
           Set(easy, CURLOPT_TCP_KEEPIDLE, kKeepAliveSeconds) &&
           Set(easy, CURLOPT_TCP_KEEPINTVL, kKeepAliveSeconds);
}

// The environment settles nothing: no proxy, and of certificates only the file
// given, or else the one that libcurl was built for.
bool Transfer::SetUp() {
    CURL* easy = easy_.get();
    const bool own = *call_->authority != '\0';
    if (call_->form == nullptr) {
        body_.emplace(call_->in, call_->bodySize);
        if (!Set(easy, CURLOPT_HTTP_TRANSFER_DECODING, 0L)) {
            return false;
        }
    }
    return Set(easy, CURLOPT_PRIVATE, this) && Set(easy, CURLOPT_URL, call_->url) &&
           Set(easy, CURLOPT_ERRORBUFFER, call_->problem) &&
           Set(easy, CURLOPT_PROTOCOLS_STR, "https") &&
           Set(easy, CURLOPT_HTTP_VERSION, CURL_HTTP_VERSION_1_1) &&
           Set(easy, CURLOPT_FOLLOWLOCATION, 0L) && Set(easy, CURLOPT_PROXY, "") &&
           Set(easy, CURLOPT_NOPROXY, "*") && Set(easy, CURLOPT_NETRC, CURL_NETRC_IGNORED) &&
           Set(easy, CURLOPT_DISALLOW_USERNAME_IN_URL, 1L) && Set(easy, CURLOPT_PATH_AS_IS, 1L) &&
           Set(easy, CURLOPT_NOSIGNAL, 1L) && Set(easy, CURLOPT_QUICK_EXIT, 1L) &&
           Set(easy, CURLOPT_SSL_CTX_FUNCTION, OnReached) &&
           Set(easy, CURLOPT_SSL_CTX_DATA, this) && Set(easy, CURLOPT_PREREQFUNCTION, OnRequest) &&
           Set(easy, CURLOPT_PREREQDATA, this) &&
           Set(easy, CURLOPT_SSLVERSION, CURL_SSLVERSION_TLSv1_2) &&
           Set(easy, CURLOPT_SSL_VERIFYPEER, 1L) && Set(easy, CURLOPT_SSL_VERIFYHOST, 2L) &&
           (!own || (Set(easy, CURLOPT_CAINFO, call_->authority) &&
                     Set(easy, CURLOPT_CAPATH, static_cast<const char*>(nullptr)))) &&
           Set(easy, CURLOPT_PINNEDPUBLICKEY, TextOrNull(call_->pin)) &&
           Set(easy, CURLOPT_USERAGENT, kUserAgent) && AddHeaders() &&
           Set(easy, CURLOPT_POST, 1L) &&
           Set(easy, CURLOPT_POSTFIELDSIZE_LARGE, static_cast<curl_off_t>(call_->bodySize)) &&
           Set(easy, CURLOPT_POSTFIELDS, call_->form) && Set(easy, CURLOPT_READFUNCTION, OnRead) &&
           Set(easy, CURLOPT_READDATA, this) && Set(easy, CURLOPT_WRITEFUNCTION, OnBody) &&
           Set(easy, CURLOPT_WRITEDATA, this) && Set(easy, CURLOPT_HEADERFUNCTION, OnHeader) &&
           Set(easy, CURLOPT_HEADERDATA, this) && Set(easy, CURLOPT_OPENSOCKETFUNCTION, OpenSocket);
}

bool Transfer::Begin(CURLM* others) {
    call_->error = static_cast<int>(talo::RelayError::kUnavailable);
    if (easy_ == nullptr) {
        return false;
    }
    Reset();
    if (!SetLimits()) {
        call_->error = static_cast<int>(talo::RelayError::kTimedOut);
        return false;
    }
    added_ = SetUp() && curl_multi_add_handle(others, easy_.get()) == CURLM_OK;
    return added_;
}

bool Transfer::End(CURLM* others, CURLcode result) {
    if (added_) {
        call_->status = Status();
        call_->error = static_cast<int>(ErrorOf(result));
        (void)curl_multi_remove_handle(others, easy_.get());
        added_ = false;
    }
    return call_->over(call_) != 0;
}

bool Transfer::IsAnsweredEarly() const {
    return body_.has_value() && !body_->IsWhole() && IsAnswerWhole();
}

bool Transfer::IsAnswerWhole() const {
    if (!headersDone_ || chunks_.has_value()) {
        return headersDone_ && chunks_->IsWhole();
    }
    const long long length = LengthOfAnswer();
    return length >= 0 && received_ >= length;
}

int Transfer::WaitsFor() const {
    return waits_ && body_.has_value() ? body_->Descriptor() : -1;
}

void Transfer::GoOn() {
    waits_ = false;
    (void)curl_easy_pause(easy_.get(), CURLPAUSE_CONT);
}

// Called when there is somebody to begin TLS with.
CURLcode Transfer::OnReached(CURL*, void*, void* self) {
    static_cast<Transfer*>(self)->reached_ = true;
    return CURLE_OK;
}

// Where a connection that was used before ends without an answer, libcurl would make
// the call again over another one. It may have been carried out already.
int Transfer::OnRequest(void* self, char*, char*, int, int) {
    Transfer* transfer = static_cast<Transfer*>(self);
    const bool repeated = transfer->requested_;
    transfer->requested_ = true;
    return repeated ? CURL_PREREQFUNC_ABORT : CURL_PREREQFUNC_OK;
}

size_t Transfer::OnRead(char* to, size_t one, size_t size, void* self) {
    Transfer* transfer = static_cast<Transfer*>(self);
    const long got = transfer->body_->Read(to, one * size);
    if (got == BodySource::kWait) {
        transfer->waits_ = true;
        return CURL_READFUNC_PAUSE;
    }
    if (got == BodySource::kEnd && !transfer->body_->IsWhole()) {
        transfer->bodyCut_ = true;
        return CURL_READFUNC_ABORT;
    }
    return static_cast<size_t>(got);
}

size_t Transfer::OnBody(char* bytes, size_t one, size_t size, void* self) {
    Transfer* transfer = static_cast<Transfer*>(self);
    const size_t count = one * size;
    transfer->received_ += static_cast<long long>(count);
    if (transfer->received_ > transfer->call_->most) {
        transfer->tooLong_ = true;
        return 0;
    }
    const bool taken = transfer->chunks_.has_value() ? transfer->TakeChunks(bytes, count)
                                                     : transfer->Take(bytes, count);
    return taken ? count : 0;
}

// A text that is none in chunks ends the call as broken.
bool Transfer::TakeChunks(const char* bytes, size_t size) {
    const char* at = bytes;
    const char* content = nullptr;
    size_t length = 0;
    while (at < bytes + size && !chunks_->IsWhole()) {
        if (!chunks_->Next(&at, bytes + size, &content, &length) || !Take(content, length)) {
            return false;
        }
    }
    return true;
}

bool Transfer::Take(const char* bytes, size_t size) {
    notTaken_ = size > 0 && Status() == kStatusOk && call_->take(call_, bytes, size) == 0;
    return !notTaken_;
}

size_t Transfer::OnHeader(char* bytes, size_t one, size_t size, void* self) {
    Transfer* transfer = static_cast<Transfer*>(self);
    const size_t count = one * size;
    transfer->headerBytes_ += static_cast<long long>(count);
    if (transfer->headerBytes_ > kMostHeaderBytes) {
        transfer->tooLong_ = true;
        return 0;
    }
    transfer->ReadHeader(bytes, count);
    return count;
}

// A status line begins another answer: of several the last one counts.
void Transfer::ReadHeader(const char* line, size_t size) {
    while (size > 0 && IsBlank(line[size - 1])) {
        --size;
    }
    if (HasPrefix(line, size, "http/")) {
        call_->requestError[0] = '\0';
        chunks_.reset();
    }
    headersDone_ = headersDone_ || (size == 0 && Status() >= kStatusFinal);
    if (headersDone_) {
        return;
    }
    if (body_.has_value() && HasPrefix(line, size, kEncodingHeader)) {
        chunks_.emplace();
    }
    if (HasPrefix(line, size, kRequestErrorHeader)) {
        ReadRequestError(line + strlen(kRequestErrorHeader), line + size);
    }
}

void Transfer::ReadRequestError(const char* value, const char* end) {
    while (value < end && IsBlank(*value)) {
        ++value;
    }
    const size_t length =
        std::min(static_cast<size_t>(end - value), sizeof call_->requestError - 1);
    memcpy(call_->requestError, value, length);
    call_->requestError[length] = '\0';
}

// -1 when the answer does not say it.
long long Transfer::LengthOfAnswer() const {
    curl_off_t length = -1;
    (void)curl_easy_getinfo(easy_.get(), CURLINFO_CONTENT_LENGTH_DOWNLOAD_T, &length);
    return length;
}

long Transfer::Status() const {
    long status = 0;
    (void)curl_easy_getinfo(easy_.get(), CURLINFO_RESPONSE_CODE, &status);
    return status;
}

// Whether somebody took the connection; who he is, is another question.
bool Transfer::WasReached() const {
    curl_off_t begun = 0;
    (void)curl_easy_getinfo(easy_.get(), CURLINFO_PRETRANSFER_TIME_T, &begun);
    return reached_ || begun > 0;
}

talo::RelayError Transfer::ErrorOf(CURLcode result) const {
    using talo::RelayError;
    const long status = Status();
    if (tooLong_ || result == CURLE_FILESIZE_EXCEEDED) {
        return RelayError::kTooLong;
    }
    if (notTaken_) {
        return RelayError::kUnavailable;
    }
    switch (result) {
        case CURLE_OK:
            // A connection that ends within the header lines ends well for libcurl.
            if (!headersDone_) {
                return RelayError::kBroken;
            }
            return status == kStatusOk ? RelayError::kNone : RelayError::kStatus;
        case CURLE_ABORTED_BY_CALLBACK:
            return bodyCut_ ? RelayError::kBadBody : RelayError::kBroken;
        case CURLE_OPERATION_TIMEDOUT:
            return WasReached() ? RelayError::kTimedOut : RelayError::kNotReached;
        case CURLE_PEER_FAILED_VERIFICATION:
        case CURLE_SSL_PINNEDPUBKEYNOTMATCH:
        case CURLE_SSL_CACERT_BADFILE:
        case CURLE_SSL_ISSUER_ERROR:
        case CURLE_SSL_INVALIDCERTSTATUS:
            return RelayError::kNotTrusted;
        case CURLE_URL_MALFORMAT:
        case CURLE_UNSUPPORTED_PROTOCOL:
        case CURLE_LOGIN_DENIED:
        case CURLE_COULDNT_RESOLVE_HOST:
        case CURLE_COULDNT_CONNECT:
        case CURLE_SSL_CONNECT_ERROR:
            return RelayError::kNotReached;
        case CURLE_OUT_OF_MEMORY:
        case CURLE_FAILED_INIT:
        case CURLE_NOT_BUILT_IN:
            return RelayError::kUnavailable;
        default:
            // Who refuses a body need not wait for its end.
            return status >= kStatusRefused ? RelayError::kStatus : RelayError::kBroken;
    }
}

}  // namespace host
