#ifndef BENCH_PEERS_JSONFILE_H
#define BENCH_PEERS_JSONFILE_H

#include <json/json.h>

#include <string>

// Reads and parses a file. False, and `document` untouched, when that fails.
bool ReadJson(const std::string& path, Json::Value* document);

#endif
