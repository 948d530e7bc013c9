// The sixteen exported functions: each hands its call to the subsystem that
// owns it. Nothing here throws (the library is built without exceptions).
#include "base/token.h"
#include "dict/dictionary.h"
#include "dict/keywords.h"
#include "errors/messages.h"
#include "scan/char_source.h"
#include "scan/directives.h"
#include "scan/scanner.h"
#include "services/declarations.h"
#include "session/lifecycle.h"
#include "source/source_stack.h"

extern "C" {

TPLEX_API status_code TPLEX_CALL sc_lex_init(void) {
    return tplex::lex_initialise();
}

TPLEX_API status_code TPLEX_CALL sc_lex_init_file(const char *name) {
    return tplex::open_source_file(name);
}

TPLEX_API status_code TPLEX_CALL sc_lex_setup(token_record **token, source_frame **frames,
                                              int16_t **depth,
                                              reserved_word_record **reserved_words,
                                              uint8_t **declare_enabled) {
    if (token != nullptr) *token = &tplex::current_token;
    if (frames != nullptr) *frames = tplex::source_stack;
    if (depth != nullptr) *depth = &tplex::source_depth;
    if (reserved_words != nullptr) *reserved_words = tplex::reserved_word_table.data();
    if (declare_enabled != nullptr) *declare_enabled = &tplex::declare_enabled;
    return 0;
}

TPLEX_API status_code TPLEX_CALL sc_next_token(void) {
    return tplex::next_token_filtered();
}

TPLEX_API status_code TPLEX_CALL sc_lex_init_defines(char **names, int32_t count) {
    return tplex::sc_lex_init_defines(names, count);
}

TPLEX_API status_code TPLEX_CALL lex_initialise(void) {
    return tplex::lex_initialise();
}

TPLEX_API status_code TPLEX_CALL lex_free(void) {
    return tplex::lex_free();
}

TPLEX_API void TPLEX_CALL back_token(void) {
    tplex::back_token();
}

TPLEX_API status_code TPLEX_CALL open_source_file(const char *name) {
    return tplex::open_source_file(name);
}

TPLEX_API status_code TPLEX_CALL rewind_input(void) {
    return tplex::rewind_input();
}

TPLEX_API status_code TPLEX_CALL parse_ident(uint8_t declare, uint8_t class_) {
    return tplex::parse_ident(declare, class_);
}

TPLEX_API status_code TPLEX_CALL dict_extend(const char *text1, const char *text2,
                                             const char *text3, uint8_t flag1, uint8_t flag2,
                                             uint8_t flag3) {
    return tplex::dict_extend(text1, text2, text3, flag1, flag2, flag3);
}

TPLEX_API status_code TPLEX_CALL dict_check(void) {
    return tplex::dict_check();
}

TPLEX_API void TPLEX_CALL sg_DisplayError(status_code code) {
    tplex::display_error(code);
}

TPLEX_API const char *TPLEX_CALL sg_GetError(status_code code) {
    return tplex::get_error(code);
}

TPLEX_API status_code TPLEX_CALL sg_closesources(void) {
    return tplex::close_sources();
}

}  // extern "C"
