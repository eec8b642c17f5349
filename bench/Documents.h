#ifndef BENCH_DOCUMENTS_H
#define BENCH_DOCUMENTS_H

#include <json/json.h>

#include <string>

namespace bench {

// A reply such as a listing gives, of about that many bytes as text.
Json::Value Listing(size_t bytes);

// A line of that many pairs: words, numbers, escapes and a little JSON.
std::string ParameterLine(int pairs);

}  // namespace bench

#endif
