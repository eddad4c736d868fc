// Linked into Windows executables whose standard output must be the same
// bytes on every host: the C runtime would otherwise turn each line feed into
// a carriage return and line feed. Set before main, before anything is written.
#include <fcntl.h>
#include <io.h>

#include <cstdio>

namespace {

const int kBinaryStdout = _setmode(_fileno(stdout), _O_BINARY);

}  // namespace
