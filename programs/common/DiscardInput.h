#ifndef TALO_PROGRAMS_COMMON_DISCARDINPUT_H
#define TALO_PROGRAMS_COMMON_DISCARDINPUT_H

// Takes what is left of a body that nobody asked for off standard input: some
// servers lose the reply of a program that ends before it has read its input.
// Never waits for a client that sends nothing, and for one that dawdles no longer
// than a moment. An upload that was refused has a client that is still sending
// for certain, and so has any body that `ends`, by a web server that closes its
// connection once it has the reply: they get longer, however much they send.
void DiscardInput(bool ends = false);

#endif
