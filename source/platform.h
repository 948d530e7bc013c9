// The only code that touches the host's file API. On Windows it passes
// straight to the C library; on a POSIX host it gives the same observable
// behaviour: text-mode reading (CR LF arrives as LF, a byte 0x1A ends the
// file) and backslashes turned into forward slashes at the moment of opening.
#ifndef TPLEX_SOURCE_PLATFORM_H
#define TPLEX_SOURCE_PLATFORM_H

#include <cstddef>
#include <cstdio>

namespace tplex::platform {

// Opens a source file for reading in text mode. Null when it cannot.
std::FILE *open_source(const char *path);
// Closes a stream opened by open_source: 0, or non-zero when the close
// reported an error (the stream is gone either way).
int close_source(std::FILE *file);
// Reads the next line into line: at most capacity - 1 characters after
// translation, stopping after a line feed (which is kept), NUL-terminated.
// False when no character could be read (end of file or a read error); the
// line is then left as it was.
// A null file reads as an empty file.
bool read_line(std::FILE *file, char *line, std::size_t capacity);

}  // namespace tplex::platform

#endif
