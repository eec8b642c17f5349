#ifndef TALO_PROGRAMS_WEBAPI_SERVER_STATUS_H
#define TALO_PROGRAMS_WEBAPI_SERVER_STATUS_H

#include <string_view>
#include <vector>

// What the system tells of this process, all of it in one reading: a call for each
// signal, limit and id would cost several times that. Made in the process that it
// is about; keeps a descriptor open.
class ProcessStatus {
  public:
    ProcessStatus();
    ~ProcessStatus();
    ProcessStatus(const ProcessStatus&) = delete;
    ProcessStatus& operator=(const ProcessStatus&) = delete;

    // False, with no fields, when the system does not tell.
    bool Read();

    // The field of that name as it was read last, "" when there is none.
    std::string_view Field(std::string_view name) const;

    // Its first number, -1 when there is none.
    long long Number(std::string_view name) const;

  private:
    struct NamedField {
        std::string_view name;
        std::string_view value;
    };

    int file_;
    std::vector<char> text_;
    std::vector<NamedField> fields_;
};

#endif
