#include "scan/directives.h"

#include <cstdio>
#include <cstring>

#include "base/memory.h"
#include "base/text.h"
#include "base/token.h"
#include "dict/dictionary.h"
#include "scan/char_source.h"
#include "scan/pass_facts.h"
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
    // A name that cannot be scanned opens nothing: its failure is the result.
    const status_code r = scan_token();
    if (r < 0) return r;
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

// Spelling a body token so that scanning the body gives the same token
// (kind, value and text) as scanning it where the name stands. The longest
// spelling is a string of 2499 quotes, each doubled, between "<\"" and "\">".
constexpr std::size_t spelling_size = 2 * std::size_t{text_size} + 8;

constexpr char pair_spellings[][3] = {"/=", "||", "&&", "<=", ">=", "<<", ">>", "..", "^^", "!="};
static_assert(sizeof pair_spellings / sizeof pair_spellings[0] ==
              op_not_equal - op_slash_equal + 1);

std::size_t spell_text(char *out, std::size_t len) {
    std::memcpy(out, tok.text, len);
    return len;
}

// A number's digits as kept, with the sign and base prefix that give its
// value back. A number cut to its first word_max digits gets eight more hex
// digits holding its value: the digits before them shift out of 32 bits. A
// record no base explains (left by a failed scan) keeps its bare text.
std::size_t spell_number(char *out, std::size_t len) {
    static constexpr struct {
        std::uint8_t base;
        char prefix[3];
    } bases[] = {{10, ""}, {16, "0x"}, {2, "0b"}};
    const auto value = static_cast<std::uint32_t>(tok.value);
    for (const auto &b : bases) {
        std::uint32_t number = 0;
        bool digits = len > 0;
        for (std::size_t i = 0; digits && i < len; ++i)
            digits = add_digit(&number, static_cast<std::uint8_t>(tok.text[i]), b.base) == 0;
        if (!digits || (number != value && 0u - number != value)) continue;
        char *p = out;
        if (number != value) *p++ = '-';
        for (const char *q = b.prefix; *q != '\0';) *p++ = *q++;
        return static_cast<std::size_t>(p - out) + spell_text(p, len);
    }
    if (len >= static_cast<std::size_t>(word_max))
        return static_cast<std::size_t>(std::snprintf(out, spelling_size, "0x%.*s%08X",
                                                      static_cast<int>(len), tok.text, value));
    return spell_text(out, len);
}

// A string or PDF string with every quote inside doubled. Comment brackets
// in the text are marker codes, which read back as themselves. (Only a "/"
// and a "*" that met across the end of a line piece or of a file stay two
// characters in the text; they read back folded into one marker.)
std::size_t spell_quoted(char *out, std::size_t len, bool pdf) {
    char *p = out;
    if (pdf) *p++ = '<';
    *p++ = '"';
    for (std::size_t i = 0; i < len; ++i) {
        if (tok.text[i] == '"') *p++ = '"';
        *p++ = tok.text[i];
    }
    *p++ = '"';
    if (pdf) *p++ = '>';
    return static_cast<std::size_t>(p - out);
}

// The spelling of the token in the record; any kind without one of its own
// (a word, a name) is its text.
std::size_t spell_token(char *out) {
    const std::size_t len = text_length(tok.text, text_size);
    switch (tok.kind) {
        case tk_number:
            return spell_number(out, len);
        case tk_string:
        case tk_pdf_string:
            return spell_quoted(out, len, tok.kind == tk_pdf_string);
        case tk_operator:
            if (tok.value >= op_slash_equal && tok.value <= op_not_equal) {
                const char *pair = pair_spellings[tok.value - op_slash_equal];
                out[0] = pair[0];
                out[1] = pair[1];
                return 2;
            }
            out[0] = static_cast<char>(tok.value & 0xFF);
            return 1;
        case tk_char:  // stored only as a first token
            if (len != 1) return spell_text(out, len);
            out[0] = '\'';
            out[1] = tok.text[0];
            out[2] = '\'';
            return 3;
        default:
            return spell_text(out, len);
    }
}

bool allowed_in_body(std::uint16_t kind) {
    return kind == tk_number || kind == tk_string || kind == tk_reserved_word ||
           kind == tk_new_identifier || kind == tk_pdf_string || kind == tk_operator;
}

// Appends the token in the record, spelled, and one blank. The spelling must
// fit with room to spare (body, spelling and 2 reaching text_size is too
// long); then a kind that a body may not hold is refused.
status_code append_token(char *body, std::size_t &n, bool allowed) {
    char spelled[spelling_size];
    const std::size_t len = spell_token(spelled);
    if (n + len + 2 >= text_size) return TPLEX_MACRO_TOO_LONG;
    if (!allowed) return TPLEX_MACRO_BAD_TOKEN;
    std::memcpy(body + n, spelled, len);
    n += len;
    body[n++] = ' ';
    body[n] = '\0';
    return 0;
}

// The body of a #define: each token spelled, and one blank. The first
// token's kind is not tested: an end of input there brings whatever text
// the record holds. Returns 0 with the last scan's result in last_scan, or
// a failure code.
status_code read_body(char *body, status_code &last_scan) {
    std::size_t n = 0;
    status_code r = append_token(body, n, true);
    while (r == 0) {
        last_scan = scan_token();
        if (last_scan == tk_end_of_line || last_scan == tk_end_of_input) return 0;
        r = append_token(body, n, allowed_in_body(tok.kind));
    }
    return r;
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
        if (cond_depth >= max_cond_depth) {
            result = TPLEX_TOO_MANY_COND_LEVELS;
        } else {
            cond_stack[++cond_depth] = flag;
            note_region_opened();
        }
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
