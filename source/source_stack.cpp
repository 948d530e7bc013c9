// The source stack: the main file at frame 1 and each included file above
// the file that includes it; the include directory list searched for
// relative names.
#include "source/source_stack.h"

#include <cstddef>
#include <cstring>

#include "base/memory.h"
#include "base/text.h"
#include "source/platform.h"

namespace tplex {

source_frame *source_stack = nullptr;
int16_t source_depth = 0;
char include_dirs[include_dir_entries][include_dir_size];
int32_t include_dir_count = 0;

namespace {

// The scanner reads up to read_slack bytes past a line's NUL: the last
// frame's line is followed by its file handle and that slack.
constexpr std::size_t source_stack_bytes = sizeof(source_frame) * source_frame_count + read_slack;

// Length of text when it has at most limit characters, else limit + 1;
// reads no further than that.
inline std::size_t bounded_length(const char *text, std::size_t limit) {
    return text_length(text, limit + 1);
}

// Puts an opened file on the stack as the new top frame.
status_code push_frame(std::FILE *file, const char *path, std::size_t path_len) {
    source_frame &frame = source_stack[source_depth + 1];
    frame.read_pos = 0;
    frame.line_no = no_line_yet;
    std::memcpy(frame.path, path, path_len);
    frame.path[path_len] = '\0';
    // No line has been read yet: a diagnostic shows an empty line rather
    // than what an earlier file left in this frame.
    frame.line_text[0] = '\0';
    frame.file = file;
    return ++source_depth;
}

// Opens name as given. A name too long for a frame's path is not opened:
// failure_code, as if the file did not exist.
status_code open_as_given(const char *name, status_code failure_code) {
    const std::size_t len = bounded_length(name, path_size - 1);
    if (len > static_cast<std::size_t>(path_size - 1)) return failure_code;
    std::FILE *file = platform::open_source(name);
    if (file == nullptr) return failure_code;
    return push_frame(file, name, len);
}

// Tries each include directory in order: directory, one backslash, name.
// A directory whose joined text would not fit a frame's path is passed over
// as one that does not hold the file; nothing is opened under a cut name.
status_code open_from_include_dirs(const char *name) {
    char joined[join_buffer_size];
    const std::size_t path_max = path_size - 1;
    const std::size_t name_len = bounded_length(name, path_max);
    for (int32_t i = 0; i < include_dir_count; ++i) {
        const char *dir = include_dirs[i];
        const std::size_t dir_len = bounded_length(dir, include_dir_size - 1);
        if (dir_len + 1 + name_len > path_max) continue;
        std::memcpy(joined, dir, dir_len);
        joined[dir_len] = '\\';
        std::memcpy(joined + dir_len + 1, name, name_len);
        joined[dir_len + 1 + name_len] = '\0';
        if (std::FILE *file = platform::open_source(joined))
            return push_frame(file, joined, dir_len + 1 + name_len);
    }
    return TPLEX_CANNOT_OPEN_SOURCE;
}

}  // namespace

status_code source_stack_create() {
    source_stack = static_cast<source_frame *>(mem_alloc(source_stack_bytes));
    if (source_stack == nullptr) return TPLEX_MALLOC_FAILED;
    std::memset(source_stack, 0, source_stack_bytes);
    // Frame 0 never holds a file, yet a diagnostic at depth 0 prints its
    // position: with no line yet it prints as line 0.
    for (int d = 0; d < source_frame_count; ++d) source_stack[d].line_no = no_line_yet;
    return 0;
}

// Files left open when the frames go would be unreachable: they are closed.
void source_stack_destroy() {
    close_source_files();
    mem_free(source_stack);
    source_stack = nullptr;
    source_depth = 0;
}

void source_stack_reset() {
    source_depth = 0;
    include_dir_count = 0;
}

// On a POSIX host a name that begins with "/" is absolute as well.
bool is_absolute_path(const char *name) {
    if (name == nullptr) return false;
    const unsigned char first = static_cast<unsigned char>(name[0]);
    const bool letter = (first >= 'A' && first <= 'Z') || (first >= 'a' && first <= 'z');
    if (letter && name[1] == ':' && name[2] == '\\' && name[3] != '\0' && name[4] != '\0')
        return true;
    if (first == '\\') return true;
#ifndef _WIN32
    if (first == '/') return true;
#endif
    return false;
}

// A failed open leaves the frame it would have used as a frame without a
// file (position 0, no line yet, no stream), where the parser can see it;
// the depth and the file below are unchanged.
status_code push_source_file(const char *name) {
    if (source_stack == nullptr) return TPLEX_NOT_INITIALISED;
    if (name == nullptr) return TPLEX_NULL_FILENAME;
    // A negative depth (only a caller writing through the handed-out
    // address can make one) is refused like a full stack rather than
    // followed outside the block.
    if (source_depth < 0 || source_depth >= max_source_depth) return TPLEX_TOO_MANY_INCLUDE_LEVELS;

    status_code result;
    if (is_absolute_path(name))
        result = open_as_given(name, TPLEX_CANNOT_OPEN_SOURCE);
    else if (include_dir_count > 0)
        result = open_from_include_dirs(name);
    else
        result = open_as_given(name, TPLEX_NO_INCLUDE_DIRS);
    if (result < 0) {
        source_frame &failed = source_stack[source_depth + 1];
        failed.read_pos = 0;
        failed.line_no = no_line_yet;
        failed.file = nullptr;
    }
    return result;
}

// Before the stack exists there is nothing open to close: 0.
status_code close_source_files() {
    if (source_stack == nullptr) return TPLEX_OK;
    status_code result = TPLEX_OK;
    for (int i = max_source_depth; i >= 1; --i) {
        source_frame &frame = source_stack[i];
        if (frame.file == nullptr) continue;
        if (platform::close_source(frame.file) != 0) result = TPLEX_CLOSE_FAILED;
        frame.file = nullptr;
    }
    return result;
}

// A null directory, or one too long for an entry (254 characters), is
// refused with TPLEX_BAD_DIRECTORY_NAME and the list is unchanged.
status_code add_include_dir(const char *dir) {
    if (include_dir_count + 1 >= include_dir_entries) return TPLEX_TOO_MANY_INCLUDE_DIRS;
    if (dir == nullptr) return TPLEX_BAD_DIRECTORY_NAME;
    const std::size_t len = bounded_length(dir, include_dir_size - 1);
    if (len > static_cast<std::size_t>(include_dir_size - 1)) return TPLEX_BAD_DIRECTORY_NAME;
    std::memcpy(include_dirs[include_dir_count], dir, len + 1);
    ++include_dir_count;
    return TPLEX_OK;
}

source_frame *pop_source_file() {
    source_frame &f = source_stack[source_depth];
    if (f.file != nullptr) platform::close_source(f.file);
    f.file = nullptr;
    --source_depth;
    return current_source_frame();
}

}  // namespace tplex
