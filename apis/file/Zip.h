#ifndef APIS_FILE_ZIP_H
#define APIS_FILE_ZIP_H

#include <memory>
#include <string>
#include <vector>

#include "Target.h"

// Answers with a zip archive of the targets, each under its own name and two of
// the same name told apart. Links and what is neither file nor folder are left
// out. Writes the whole answer; false before the first byte, when no archive can
// be made. An archive that breaks off later lacks its end.
bool SendZip(const std::vector<std::unique_ptr<Target>>& targets, bool onlyHeader);

#endif
