#include "lex/lexer.h"

#include <cstring>

#include "dict/declarations.h"
#include "dict/dictionary.h"
#include "lex/keywords.h"
#include "lex/memory.h"
#include "scan/char_source.h"
#include "scan/directives.h"
#include "source/platform.h"
#include "source/source_stack.h"

namespace tplex {

token_record current_token;
std::uint8_t push_back_flag = 0;
std::uint8_t declare_enabled = 1;

namespace {

// Every counter, depth and flag to its starting value.
void reset_counters() {
    source_depth = 0;
    macro_depth = 0;
    shared_class_counter = 0;
    general_counter = 1;
    cond_depth = 0;
    cond_stack[0] = 1;
    include_dir_count = 0;
}

// Every frame without a file and with an empty path and line. Frame 0 never
// holds a file, yet a diagnostic at depth 0 prints its position: line
// number all ones prints as line 0.
// The scanner looks at 16 bytes at a time from a line's NUL on: the last
// frame's line is followed by its file handle and this much more.
constexpr std::size_t source_stack_bytes = sizeof(source_frame) * source_frame_count + 16;

void clear_frames() {
    std::memset(source_stack, 0, source_stack_bytes);
    for (int d = 0; d < source_frame_count; ++d) source_stack[d].line_no = 0xFFFFFFFFu;
}

// Files left open when the frames go would be unreachable: close them.
void close_frames() {
    if (source_stack == nullptr) return;
    for (int d = source_frame_count - 1; d >= 1; --d) {
        source_frame &f = source_stack[d];
        if (f.file != nullptr) platform::close_source(f.file);
        f.file = nullptr;
    }
}

void release_all() {
    char_source_forget();
    close_frames();
    dict_destroy();
    mem_free(macro_stack);
    macro_stack = nullptr;
    mem_free(source_stack);
    source_stack = nullptr;
    source_depth = 0;
    macro_depth = 0;
}

}  // namespace

status_code lex_initialise() {
    // A second call without lex_free starts afresh: the first call's state
    // is released first, so nothing is released twice or leaked.
    release_all();

    declare_enabled = 1;
    push_back_flag = 0;
    reset_counters();

    if (dict_create() != 0) return TPLEX_MALLOC_FAILED;
    macro_stack = static_cast<macro_frame *>(mem_alloc(sizeof(macro_frame) * macro_frame_count));
    if (macro_stack == nullptr) {
        dict_destroy();
        return TPLEX_MALLOC_FAILED;
    }
    source_stack = static_cast<source_frame *>(mem_alloc(source_stack_bytes));
    if (source_stack == nullptr) {
        dict_destroy();
        mem_free(macro_stack);
        macro_stack = nullptr;
        return TPLEX_MALLOC_FAILED;
    }
    clear_frames();
    fill_hash_weights();
    load_keywords();
    return 0;
}

status_code lex_free() {
    // Also safe after a failed lex_initialise and without any: the pointers
    // are null then.
    release_all();
    return 0;
}

void lex_reset() {
    char_source_sync();
    reset_counters();
    dict_clear();
    load_keywords();
}

void back_token() {
    push_back_flag = 1;
}

}  // namespace tplex
