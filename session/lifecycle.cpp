#include "session/lifecycle.h"

#include "base/text.h"
#include "dict/dictionary.h"
#include "dict/keywords.h"
#include "scan/char_source.h"
#include "scan/directives.h"
#include "scan/pass_facts.h"
#include "scan/scanner.h"
#include "services/declarations.h"
#include "source/source_stack.h"

namespace tplex {

namespace {

// Every counter, depth and flag that a further pass starts again from.
void reset_counters() {
    drop_macros();
    source_stack_reset();
    declarations_reset();
    directives_reset();
}

void release_all() {
    char_source_destroy();
    source_stack_destroy();
    dict_destroy();
}

}  // namespace

status_code lex_initialise() {
    // A second call without lex_free starts afresh: the first call's state
    // is released first, so nothing is released twice or leaked.
    release_all();

    declarations_init();
    scanner_reset();
    pass_facts_reset();
    reset_counters();

    if (dict_create() != 0 || char_source_create() != 0 || source_stack_create() != 0) {
        release_all();
        return TPLEX_MALLOC_FAILED;
    }
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
    reset_counters();
    dict_clear();
    load_keywords();
}

// The main file is reopened under the path it was opened with, which, with
// the include directories gone, reaches the same file.
status_code rewind_input() {
    if (source_stack == nullptr) return TPLEX_NOT_INITIALISED;
    lex_reset();
    char main_path[path_size];
    copy_text(main_path, sizeof main_path, source_stack[1].path);
    close_sources();
    return open_source_file(main_path);
}

}  // namespace tplex
