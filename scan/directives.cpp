#include "scan/directives.h"

#include <cstdio>
#include <cstring>

#include "base/memory.h"
#include "base/text.h"
#include "base/token.h"
#include "dict/dictionary.h"
#include "scan/char_source.h"
#include "scan/scanner.h"

namespace tplex {

std::uint8_t cond_stack[cond_flag_count] = {1};
std::uint16_t cond_depth = 0;

void directives_reset() {
    cond_depth = 0;
    cond_stack[0] = 1;
}

namespace {

token_record &tok = current_token;

// #include: opens the file named by the next token. Whatever follows the
// name on the line is never read: the new file is read next, and when it
// ends, reading resumes with the includer's next line.
status_code do_include() {
    if (!region_live()) return 0;  // the name is then skipped like any token
    // As in #define, a failure while the name is scanned is not passed on:
    // nothing is opened and reading goes on after it.
    if (scan_token() < 0) return 0;
    char name[text_size];  // any token's text names the file
    copy_text(name, text_size, tok.text);
    return open_source_file(name);
}

// #ifdef and #ifndef: the name decides the new region's flag, which is
// pushed even when the result is a failure.
status_code do_ifdef(bool want_defined, std::uint8_t &flag) {
    status_code result = scan_token();
    flag = 0;
    if (region_live()) {
        if (tok.kind == tk_new_identifier)
            flag = want_defined ? 0 : 1;
        else if (tok.kind == tk_hash_definition)
            flag = want_defined ? 1 : 0;
        else
            result = TPLEX_BAD_HASH_WORD;
    }
    return result;
}

status_code do_endif() {
    if (cond_depth == 0) return TPLEX_EXTRA_ENDIF;
    --cond_depth;
    return 0;
}

// The body of a #define: the text of each token and one blank, the first
// token's string in quotes. Returns 0 with the last scan's result in
// last_scan, or a failure code.
status_code read_body(char *body, status_code &last_scan) {
    std::size_t n;
    if (tok.kind == tk_string) {
        // The quoted text and its blank must fit the body with its NUL.
        const std::size_t len = text_length(tok.text, text_size);
        if (len + 3 > text_size - 1) return TPLEX_MACRO_TOO_LONG;
        n = static_cast<std::size_t>(
            std::snprintf(body, text_size, "\"%.*s\" ", static_cast<int>(len), tok.text));
    } else {
        // The first token's kind is not tested: an operator or an end of
        // input brings whatever text the record holds, and a text too long
        // for the body with its blank is refused rather than cut.
        const std::size_t len = text_length(tok.text, text_size);
        if (len + 1 > text_size - 1) return TPLEX_MACRO_TOO_LONG;
        std::memcpy(body, tok.text, len);
        body[len] = ' ';
        n = len + 1;
    }
    body[n] = '\0';

    for (;;) {
        last_scan = scan_token();
        if (last_scan == tk_end_of_line || last_scan == tk_end_of_input) return 0;
        const std::size_t len = text_length(tok.text, text_size);
        if (n + len + 2 >= text_size) return TPLEX_MACRO_TOO_LONG;
        switch (tok.kind) {
            case tk_number:
            case tk_string:
            case tk_reserved_word:
            case tk_new_identifier:
            case tk_pdf_string:
                std::memcpy(body + n, tok.text, len);
                n += len;
                break;
            case tk_operator:
                body[n++] = static_cast<char>(tok.value & 0xFF);
                break;
            default:
                return TPLEX_MACRO_BAD_TOKEN;
        }
        body[n++] = ' ';
        body[n] = '\0';
    }
}

// Stores a name with its body. A name that cannot be stored whole is not
// stored at all: a name of kind 4 without its body would expand to
// whatever body was looked up last.
status_code store_macro(const char *name, const char *body, status_code done) {
    const status_code r = dict_insert(tk_macro, 0, name);
    if (r < 0) return r;
    if (dict_extend(body, "", "", 0, 0, 0) == 0) return done;
    dict_discard();
    return TPLEX_MALLOC_FAILED;
}

// #define NAME [body]. Scanner failures while the name and body are read are
// not passed on: the record as the scanner left it counts as the token.
status_code do_define() {
    scan_token();
    // The name and the body get one block: text_size for each.
    char *name = static_cast<char *>(mem_alloc(2 * std::size_t{text_size}));
    if (name == nullptr) return TPLEX_MALLOC_FAILED;
    char *body = name + text_size;
    copy_text(name, text_size, tok.text);
    const std::uint16_t name_kind = tok.kind;

    status_code result = scan_token();
    if (result == tk_end_of_line) {
        if (region_live()) {
            if (dict_lookup(name) == 1)
                result = TPLEX_UNEXPECTED_HASH_WORD;
            else if (name_kind == tk_new_identifier) {
                const status_code r = dict_insert(tk_hash_definition, 0, name);
                if (r < 0) result = r;  // not stored: say so
            } else if (name_kind != tk_hash_definition)
                result = TPLEX_BAD_HASH_WORD;
        }
    } else if (dict_lookup(name) == 1) {
        result = TPLEX_MACRO_REDEFINED;  // checked in live and dead regions alike
    } else {
        status_code last_scan = 0;
        result = read_body(body, last_scan);
        if (result == 0) {
            if (dict_lookup(name) == 1) {
                result = TPLEX_MACRO_REDEFINED;
            } else {
                result = last_scan;
                if (region_live()) result = store_macro(name, body, last_scan);
            }
        }
    }
    mem_free(name);
    return result;
}

}  // namespace

status_code process_hash_directive() {
    status_code result = 0;
    bool push = false;
    std::uint8_t flag = 0;
    switch (static_cast<std::uint32_t>(tok.value) - hw_define) {
        case hw_define - hw_define:
            result = do_define();
            break;
        case hw_ifdef - hw_define:
            push = true;
            result = do_ifdef(true, flag);
            break;
        case hw_ifndef - hw_define:
            push = true;
            result = do_ifdef(false, flag);
            break;
        case hw_endif - hw_define:
            result = do_endif();
            break;
        case hw_include - hw_define:
            result = do_include();
            break;
        default:
            result = TPLEX_UNEXPECTED_HASH_WORD;
            break;
    }
    if (push) {
        // A 21st region is refused: the depth stays at 20, so no flag past
        // entry 20 is ever read or written.
        if (cond_depth >= max_cond_depth)
            result = TPLEX_TOO_MANY_COND_LEVELS;
        else
            cond_stack[++cond_depth] = flag;
    }
    return result;
}

status_code sc_lex_init_defines(char **names, std::int32_t count) {
    if (names == nullptr || count <= 0) return 0;
    if (dict_slots == nullptr) return TPLEX_NOT_INITIALISED;
    for (std::int32_t i = 0; i < count; ++i) {
        if (names[i] == nullptr) continue;  // no name to define
        if (dict_lookup(names[i]) == 1) return TPLEX_ALREADY_DEFINED;
        // A name that cannot be stored stops here, like one already known.
        const status_code r = dict_insert(tk_hash_definition, 2, names[i]);
        if (r < 0) return r;
    }
    return 0;
}

}  // namespace tplex
