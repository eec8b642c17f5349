#ifndef BENCH_GROUPS_H
#define BENCH_GROUPS_H

namespace bench {

void JsonText();      // the serialiser against the library's writers
void Requests();      // parameter lines, description look-up, a call in-process
void Sessions();      // a session check, and the elements of a compound request
void Multipart();     // the parser of uploads against a copy
void Uploads();       // a large upload against cat into a file
void Downloads();     // a file into a pipe against cat
void Tasks();         // the start, the status and the lists of background tasks
void Ciphers();       // the deciphering of a parameter line
void Relays();        // a call over another appliance against a direct one
void ProcessStart();  // a whole entry.cgi process against a bare program

}  // namespace bench

#endif
