// The stack of open source files and the include directory list.
#ifndef TPLEX_SOURCE_SOURCE_STACK_H
#define TPLEX_SOURCE_SOURCE_STACK_H

#include "lex/limits.h"
#include "tplex/lexer.h"

namespace tplex {

// 20 frames in one block, allocated by lex_initialise (null before it).
// Frame 0 never holds a file; the main file is frame 1.
extern source_frame *source_stack;
// Index of the current frame; 0 when no file is open.
extern int16_t source_depth;
extern char include_dirs[include_dir_entries][include_dir_size];
extern int32_t include_dir_count;

// True for a drive path ("D:\x...", longer than 4 characters), a name that
// begins with a backslash, and on a POSIX host a name that begins with "/".
bool is_absolute_path(const char *name);

// Pushes a frame for the file. The new source depth, or
// TPLEX_TOO_MANY_INCLUDE_LEVELS, TPLEX_CANNOT_OPEN_SOURCE,
// TPLEX_NO_INCLUDE_DIRS (and TPLEX_NULL_FILENAME, TPLEX_NOT_INITIALISED)
// with the stack as it was.
status_code open_source_file(const char *name);
// Closes every open file, frames 19 down to 1. 0 or TPLEX_CLOSE_FAILED.
status_code close_sources();
// lex_reset, then closes everything and reopens the main file.
status_code rewind_input();
// Appends a directory to the search list. 0 or TPLEX_TOO_MANY_INCLUDE_DIRS.
status_code add_include_dir(const char *dir);

}  // namespace tplex

#endif
