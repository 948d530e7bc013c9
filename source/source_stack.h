// The stack of open source files and the include directory list. This
// subsystem owns the frames, the depth and the list; the character source
// above it reads the frames and keeps each frame's read position.
#ifndef TPLEX_SOURCE_SOURCE_STACK_H
#define TPLEX_SOURCE_SOURCE_STACK_H

#include <cstdint>

#include "base/limits.h"
#include "source/platform.h"
#include "tplex/lexer.h"

namespace tplex {

// A frame's line number before its file's first line: all ones, so the
// line number plus one, as diagnostics print it, is 0.
inline constexpr std::uint32_t no_line_yet = 0xFFFFFFFFu;

// 20 frames in one block, allocated by source_stack_create (null before it).
// Frame 0 never holds a file; the main file is frame 1.
extern source_frame *source_stack;
// Index of the current frame; 0 when no file is open.
extern int16_t source_depth;
extern char include_dirs[include_dir_entries][include_dir_size];
extern int32_t include_dir_count;

// Allocates the frames, each without a file, with an empty path and line
// and no line yet. 0 or TPLEX_MALLOC_FAILED.
status_code source_stack_create();
// Closes every file left open and releases the frames.
void source_stack_destroy();
// Depth 0 and no include directories; the frames are left as they are.
void source_stack_reset();

// True for a drive path ("D:\x...", longer than 4 characters), a name that
// begins with a backslash, and on a POSIX host a name that begins with "/".
bool is_absolute_path(const char *name);

// Pushes a frame for the file. The new source depth, or
// TPLEX_TOO_MANY_INCLUDE_LEVELS, TPLEX_CANNOT_OPEN_SOURCE,
// TPLEX_NO_INCLUDE_DIRS (and TPLEX_NULL_FILENAME, TPLEX_NOT_INITIALISED)
// with the stack as it was. (Readers open through the character source's
// open_source_file, which keeps its cursor right.)
status_code push_source_file(const char *name);
// Closes every open file, frames 19 down to 1. 0 or TPLEX_CLOSE_FAILED.
status_code close_source_files();
// Appends a directory to the search list. 0, TPLEX_TOO_MANY_INCLUDE_DIRS or
// TPLEX_BAD_DIRECTORY_NAME.
status_code add_include_dir(const char *dir);

// Reads the frame's next line into its buffer and counts it: false at the
// end of its file, the frame then unchanged.
inline bool read_next_line(source_frame &f) {
    if (!platform::read_line(f.file, f.line_text, line_size)) return false;
    ++f.line_no;
    return true;
}
// The frame being read, or null when no file is open (or the depth has been
// set out of range through the parser's address).
inline source_frame *current_source_frame() {
    if (source_stack == nullptr || source_depth < 1 || source_depth > max_source_depth)
        return nullptr;
    return &source_stack[source_depth];
}
// Closes the current frame's file (its end was reached) and returns to the
// frame below: that frame, or null when no file is left open.
source_frame *pop_source_file();

}  // namespace tplex

#endif
