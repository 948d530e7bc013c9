#include "lexer_harness.h"

#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <string>
#include <vector>

#include "base/memory.h"
#include "base/token.h"
#include "harness_support.h"
#include "scan/char_source.h"
#include "scan/directives.h"
#include "scan/scanner.h"
#include "services/declarations.h"
#include "services/string_arg.h"
#include "session/lifecycle.h"
#include "source/source_stack.h"
#include "tplex/lexer.h"

namespace tplex::fuzz {

namespace {

// Calls made in one run, script and draining together. Macro bodies can
// expand to very many tokens, so the end of input is not always reached.
constexpr int step_limit = 3000;
// Calls that walk all 1664 slots (dict_check, rewind_input, restarts) cost
// a thousand plain calls each: a run makes only this many of them.
constexpr int heavy_limit = 8;

// The addresses sc_lex_setup hands out; the frames move with each
// lex_initialise.
struct lexer_view {
    token_record *tok = nullptr;
    source_frame *frames = nullptr;
    std::int16_t *depth = nullptr;
    reserved_word_record *words = nullptr;
    std::uint8_t *declare = nullptr;
    // back_token hands back whatever kind the record holds, also one that
    // a failed scan or a lookup left there; the next read is not a token.
    bool pushed_back = false;
    int heavy_calls = 0;

    bool heavy() { return ++heavy_calls <= heavy_limit; }

    void refresh() {
        TPLEX_FUZZ_CHECK(sc_lex_setup(&tok, &frames, &depth, &words, &declare) == 0, 0);
    }
};

// What must hold between any two calls. The frames' texts are large, so
// all of them are looked at only now and then (full), the current one always.
void check_state(const lexer_view &v, bool full) {
    TPLEX_FUZZ_CHECK(*v.depth >= 0 && *v.depth < TPLEX_SOURCE_FRAMES, *v.depth);
    TPLEX_FUZZ_CHECK(macro_depth <= macro_frame_count, macro_depth);
    TPLEX_FUZZ_CHECK(cond_depth <= max_cond_depth, cond_depth);
    TPLEX_FUZZ_CHECK(cond_stack[0] == 1, cond_stack[0]);
    const token_record &t = *v.tok;
    TPLEX_FUZZ_CHECK(terminated(t.text, TPLEX_TEXT_SIZE), t.kind);
    TPLEX_FUZZ_CHECK(terminated(t.def_text1, TPLEX_TEXT_SIZE), t.kind);
    TPLEX_FUZZ_CHECK(terminated(t.def_text2, TPLEX_TEXT_SIZE), t.kind);
    TPLEX_FUZZ_CHECK(terminated(t.def_text3, TPLEX_TEXT_SIZE), t.kind);
    TPLEX_FUZZ_CHECK(t.slot < 1664, t.slot);
    if (v.frames == nullptr) return;
    for (int d = full ? 1 : *v.depth; d < TPLEX_SOURCE_FRAMES; ++d) {
        const source_frame &f = v.frames[d];
        // A file leaves the stack only once closed.
        if (d > *v.depth) TPLEX_FUZZ_CHECK(f.file == nullptr, d);
        if (!full && d != *v.depth) continue;
        TPLEX_FUZZ_CHECK(terminated(f.path, TPLEX_PATH_SIZE), d);
        TPLEX_FUZZ_CHECK(terminated(f.line_text, TPLEX_LINE_SIZE), d);
    }
}

void check_no_files(const lexer_view &v) {
    if (v.frames == nullptr) return;
    for (int d = 0; d < TPLEX_SOURCE_FRAMES; ++d) TPLEX_FUZZ_CHECK(v.frames[d].file == nullptr, d);
}

std::int32_t status(std::int32_t r) {
    TPLEX_FUZZ_CHECK(is_status(r), r);
    return r;
}

// The parser never sees a name with a body, a hash word or an end of line.
std::int32_t token_result(std::int32_t r, lexer_view &v) {
    status(r);
    if (!v.pushed_back)
        TPLEX_FUZZ_CHECK(r != tk_macro && r != tk_hash_word && r != tk_end_of_line, r);
    v.pushed_back = false;
    return r;
}

// A status code to display: the catalogue and its edges, the table output
// range, or odd values.
std::int32_t pick_code(script_reader &s, std::int32_t last) {
    const std::uint8_t b = s.byte();
    if (b < 0x40) return TPLEX_STATUS(0xD3470200u + b);
    if (b < 0x60) return TPLEX_STATUS(0xD3470000u + (b - 0x40));
    switch (b & 7) {
        case 0:
            return last;
        case 1:
            return TPLEX_ALREADY_DEFINED;
        case 2:
            return 0;
        case 3:
            return 36;
        case 4:
            return INT32_MIN;
        case 5:
            return -1;
        case 6:
            return INT32_MAX;
        default:
            return static_cast<std::int32_t>(s.u32());
    }
}

// A text argument: made up, taken from the script, or the token record's
// own fields (which the library may be copying from while it writes).
const char *pick_text(script_reader &s, const lexer_view &v, std::string &store) {
    const std::uint8_t b = s.byte();
    switch (b & 3) {
        case 0:
            store.assign(static_cast<std::size_t>(b >> 2) * 50, static_cast<char>('a' + (b & 15)));
            return store.c_str();
        case 1:
            return v.tok->text;
        case 2:
            return v.tok->def_text1;
        default:
            store = s.text(s.byte());
            return store.c_str();
    }
}

const char *pick_file(script_reader &s, std::string &store) {
    switch (s.byte() % 8) {
        case 0:
            return "inc.src";
        case 1:
            return "main.src";
        case 2:
            return "missing.src";
        case 3:
            return "";
        case 4:
            store = work_dir() + "/inc.src";
            return store.c_str();
        case 5:
            store.assign(300, 'n');
            return store.c_str();
        case 6:
            return "\\inc.src";
        default:
            store = s.text(s.byte() % 32);
            return store.c_str();
    }
}

void predefine(script_reader &s) {
    const std::uint8_t b = s.byte();
    std::vector<std::string> names(b % 5);
    for (std::string &n : names) {
        const std::uint8_t len = s.byte();
        n = len == 255 ? std::string(300, 'L') : s.text(len % 40);
    }
    std::vector<char *> ptrs;
    for (std::string &n : names) ptrs.push_back(n.data());
    const std::int32_t count = (b & 0x80) != 0 ? -static_cast<std::int32_t>(names.size())
                                               : static_cast<std::int32_t>(names.size());
    status(sc_lex_init_defines(ptrs.empty() ? nullptr : ptrs.data(), count));
}

// The parser's documented duty before the state goes: close the sources.
void restart(lexer_view &v, bool free_first) {
    status(sg_closesources());
    check_no_files(v);
    if (free_first) TPLEX_FUZZ_CHECK(lex_free() == 0, 0);
    const std::int32_t r = status(sc_lex_init());
    TPLEX_FUZZ_CHECK(r == 0 || r == TPLEX_MALLOC_FAILED, r);
    v.refresh();
    v.pushed_back = false;
    if (r == 0) status(sc_lex_init_file("main.src"));
}

// TPLEX_FUZZ_TRACE=1 in the environment prints each step on standard error.
const bool tracing = std::getenv("TPLEX_FUZZ_TRACE") != nullptr;

void trace(const char *what, std::uint8_t op, const lexer_view &v, std::int32_t last) {
    if (!tracing) return;
    std::fprintf(stderr,
                 "%-6s op %2d -> %d (0x%x)  kind %u value %d slot %u depth %d macro %u cond %u "
                 "text \"%.40s\"\n",
                 what, op, last, static_cast<unsigned>(last), v.tok->kind, v.tok->value,
                 v.tok->slot, *v.depth, macro_depth, cond_depth, v.tok->text);
}

// Rarely wanted calls: internal operations and lifecycle.
void rare_call(script_reader &s, lexer_view &v) {
    const std::uint8_t op = s.byte() % 8;
    if (tracing) std::fprintf(stderr, "rare   op %2d\n", op);
    switch (op) {
        case 0: {
            const std::uint16_t number = s.u16();
            const auto code = static_cast<std::int16_t>(s.u16());
            const std::int32_t r = status(make_label(number, code, s.byte() % 3));
            TPLEX_FUZZ_CHECK(r == 0 || r == TPLEX_DISASTER || r == TPLEX_MALLOC_FAILED ||
                                 r == TPLEX_NOT_INITIALISED,
                             r);
            break;
        }
        case 1: {
            char out[TPLEX_TEXT_SIZE];
            std::memset(out, 'u', sizeof out);
            out[sizeof out - 1] = '\0';
            const std::int32_t r = status(parse_string(out, s.byte() % 3));
            // A stale record handed back stays stale when parse_string
            // gives it back again.
            v.pushed_back = v.pushed_back && push_back_flag == 1;
            TPLEX_FUZZ_CHECK(terminated(out, sizeof out), r);
            break;
        }
        case 2: {
            std::string dir;
            switch (s.byte() % 4) {
                case 0:
                    dir = ".";
                    break;
                case 1:
                    dir = work_dir();
                    break;
                case 2:
                    dir = "nodir";
                    break;
                default:
                    dir.assign(300, 'd');
                    break;
            }
            status(add_include_dir(dir.c_str()));
            break;
        }
        case 3:
            if (v.heavy()) restart(v, true);
            break;
        case 4:
            if (v.heavy()) restart(v, false);
            break;
        case 5: {
            token_record *t = nullptr;
            TPLEX_FUZZ_CHECK(sc_lex_setup(&t, nullptr, nullptr, nullptr, nullptr) == 0, 0);
            TPLEX_FUZZ_CHECK(t == v.tok, 0);
            break;
        }
        default: {
            const std::int32_t r = status(sc_lex_init_file("main.src"));
            (void)r;
            break;
        }
    }
}

// One script step.
void step(script_reader &s, lexer_view &v, std::int32_t &last) {
    std::string a, b, c;
    const std::uint8_t op = s.byte() & 15;
    struct tracer {
        const char *what;
        std::uint8_t op;
        const lexer_view &v;
        const std::int32_t &last;
        ~tracer() { trace(what, op, v, last); }
    } t{"step", op, v, last};
    switch (op) {
        case 0:
        case 1:
        case 2:
            last = token_result(sc_next_token(), v);
            break;
        case 3: {
            const std::uint8_t declare = s.byte() & 1;
            std::uint8_t class_ = s.byte();
            if (class_ < 0xC0) class_ = static_cast<std::uint8_t>(13 + class_ % 15);
            last = status(parse_ident(declare, class_));
            v.pushed_back = false;
            break;
        }
        case 4:
            back_token();
            v.pushed_back = true;
            break;
        case 5: {
            const char *t1 = pick_text(s, v, a);
            const char *t2 = pick_text(s, v, b);
            const char *t3 = pick_text(s, v, c);
            const std::uint8_t f = s.byte();
            last = status(dict_extend(t1, t2, t3, f & 1, f & 2, f & 4));
            break;
        }
        case 6:
            predefine(s);
            break;
        case 7:
            if (v.heavy()) last = status(rewind_input());
            break;
        case 8: {
            if (!v.heavy()) break;
            const std::int32_t r = status(dict_check());
            TPLEX_FUZZ_CHECK(r == 0 || r == TPLEX_UNDECLARED_IDENTIFIER, r);
            break;
        }
        case 9:
            sg_DisplayError(pick_code(s, last));
            break;
        case 10: {
            const char *text = sg_GetError(pick_code(s, last));
            TPLEX_FUZZ_CHECK(text != nullptr && terminated(text, 200), 0);
            break;
        }
        case 11:
            *v.declare = s.byte() % 3;
            break;
        case 12:
            last = status(open_source_file(pick_file(s, a)));
            break;
        case 13:
            status(sg_closesources());
            check_no_files(v);
            break;
        case 14:
#ifdef TPLEX_ALLOC_HOOK
            mem_fail_at(s.byte() + 1u);
#else
            s.byte();
#endif
            break;
        default:
            rare_call(s, v);
            break;
    }
}

}  // namespace

void run_lexer(const std::uint8_t *data, std::size_t size) {
    const in_work_dir here;
    part parts[3];
    split_input(data, size, parts, 3);
    write_file("main.src", parts[0].data, parts[0].size);
    write_file("inc.src", parts[1].data, parts[1].size);
    const fd_set_snapshot fds_before = open_fds();

    lexer_view v;
    TPLEX_FUZZ_CHECK(sc_lex_init() == 0, 0);
    v.refresh();
    TPLEX_FUZZ_CHECK(sc_lex_init_file("main.src") == 1, 0);

    script_reader s(parts[2].data, parts[2].size);
    std::int32_t last = 0;
    int steps = 0;
    for (; steps < step_limit && !s.done(); ++steps) {
        step(s, v, last);
        check_state(v, steps % 64 == 0);
    }
#ifdef TPLEX_ALLOC_HOOK
    mem_fail_at(0);
#endif
    for (; steps < step_limit; ++steps) {
        const std::int32_t r = token_result(sc_next_token(), v);
        trace("drain", 0, v, r);
        check_state(v, steps % 64 == 0);
        if (r != tk_end_of_input) continue;
        // With both stacks empty, the end of input repeats for ever.
        if (*v.depth == 0 && macro_depth == 0)
            TPLEX_FUZZ_CHECK(token_result(sc_next_token(), v) == tk_end_of_input, 0);
        break;
    }

    check_state(v, true);
    status(sg_closesources());
    check_no_files(v);
    TPLEX_FUZZ_CHECK(lex_free() == 0, 0);
    TPLEX_FUZZ_CHECK(lex_free() == 0, 0);  // a second release finds nothing
    TPLEX_FUZZ_CHECK(open_fds() == fds_before, 0);
}

}  // namespace tplex::fuzz
