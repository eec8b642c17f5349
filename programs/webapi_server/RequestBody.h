#ifndef TALO_PROGRAMS_WEBAPI_SERVER_REQUESTBODY_H
#define TALO_PROGRAMS_WEBAPI_SERVER_REQUESTBODY_H

// The body of a request whose variables are the environment, on standard input.

// As CONTENT_LENGTH announces it.
long long LengthOfBody();

// A method may read its input to the end, which a connection that the web server
// keeps open does not have. Where all of the body is here already, its end is made;
// a small one that is just coming is waited for.
void EndInputBehindBody();

// Whether more of it arrives, from a client that has been refused.
bool IsBodyStillComing();

#endif
