// scan_token and sc_next_token against a plain model of the character source,
// the scanner and the directive filter, one character at a time through
// read_char, peek_char and next_char, on generated inputs: files, an included
// file, bodies of names defined with a body, long lines at the 4999 edge, NUL
// bytes and the marker bytes. Whatever the library does to be fast, its
// results and records must be the model's.
#include <gtest/gtest.h>

#include <cstdio>
#include <random>
#include <string>
#include <vector>

#include "base/token.h"
#include "dict/dictionary.h"
#include "lex_harness.h"
#include "scan/char_source.h"
#include "scan/directives.h"
#include "scan/scanner.h"
#include "services/declarations.h"
#include "session/lifecycle.h"
#include "source/source_stack.h"

using tplex::test::LexSession;
using tplex::test::TempDir;

namespace {

struct Record {
    std::uint16_t kind;
    std::int32_t value;
    std::string text, def1;
};

struct Model {
    struct Body {
        std::string text;
        std::size_t pos = 0;
    };
    struct File {
        std::FILE *f = nullptr;
        char line[5000] = {};
        std::uint16_t pos = 0;
        bool started = false, ended = false;  // ended: a 0x1A byte ends the file for good
    };
    std::vector<Body> bodies;
    std::vector<File> files;
    Record rec;
    std::uint8_t flags[21] = {1};
    int depth = 0;

    explicit Model(const std::vector<std::string> &paths) {
        const token_record &t = tplex::current_token;
        rec = Record{t.kind, t.value, t.text, t.def_text1};
        for (const std::string &p : paths) files.emplace_back().f = std::fopen(p.c_str(), "r");
    }
    ~Model() {
        for (File &f : files) std::fclose(f.f);
    }

    // One line in text mode: CR LF as LF, 0x1A ends the file, at most 4999
    // characters, stopping after a LF.
    static bool read_line(File &f) {
        std::size_t n = 0;
        while (n < 4999 && !f.ended) {
            int c = std::getc(f.f);
            if (c == EOF) break;
            if (c == 0x1A) {
                f.ended = true;
                break;
            }
            if (c == '\r') {
                const int next = std::getc(f.f);
                if (next == '\n')
                    c = '\n';
                else if (next != EOF)
                    std::ungetc(next, f.f);
            }
            f.line[n++] = static_cast<char>(c);
            if (c == '\n') break;
        }
        f.line[n] = '\0';
        return n > 0;
    }

    int read_char() {
        while (!bodies.empty() && bodies.back().pos > bodies.back().text.size()) bodies.pop_back();
        if (!bodies.empty()) {
            Body &b = bodies.back();
            return b.pos < b.text.size() ? static_cast<unsigned char>(b.text[b.pos++])
                                         : (++b.pos, 0);
        }
        if (files.empty()) return 255;
        File *f = &files.back();
        if (!f->started || f->line[f->pos] == 0) {
            while (!read_line(*f)) {
                std::fclose(f->f);
                files.pop_back();
                if (files.empty()) return 255;
                f = &files.back();
            }
            f->started = true;
            f->pos = 0;
        }
        const int c = static_cast<unsigned char>(f->line[f->pos]);
        if (c != 0) ++f->pos;
        return c;
    }
    int peek_char() const {
        if (!bodies.empty()) {
            const Body &b = bodies.back();
            return b.pos < b.text.size() ? static_cast<unsigned char>(b.text[b.pos]) : ' ';
        }
        if (files.empty() || files.back().line[files.back().pos] == 0) return ' ';
        return static_cast<unsigned char>(files.back().line[files.back().pos]);
    }
    int next_char() {
        const int c = read_char();
        if (c == '/' && peek_char() == '*') return read_char(), 251;
        if (c == '*' && peek_char() == '/') return read_char(), 252;
        if (c == '/' && peek_char() == '/') return read_char(), 253;
        return c;
    }

    static bool letter(int c) { return (c >= 'A' && c <= 'Z') || (c >= 'a' && c <= 'z'); }
    static bool digit(int c) { return c >= '0' && c <= '9'; }
    static bool hex(int c) { return digit(c) || (c >= 'A' && c <= 'F') || (c >= 'a' && c <= 'f'); }
    static bool ident(int c) { return letter(c) || digit(c) || c == '_'; }

    // dict_lookup of a name, upper-cased in place; a found entry fills the record.
    int lookup(std::string &name) {
        char buf[2500];
        std::snprintf(buf, sizeof buf, "%s", name.c_str());
        const int r = tplex::dict_lookup(buf);
        name = buf;
        if (r == 1) {
            const token_record &t = tplex::current_token;
            rec.kind = t.kind;
            rec.value = t.value;
            rec.text = t.text;
            if (t.has_definition) rec.def1 = t.def_text1;
        }
        return r;
    }
    void word_rest() {
        while (ident(peek_char())) {
            const int c = next_char();
            if (rec.text.size() < 128) rec.text.push_back(static_cast<char>(c));
        }
    }
    int word_lookup() {
        std::string name = rec.text;
        const int r = lookup(name);
        if (r != 1) rec.text = name;
        return r;
    }
    static std::int32_t add_digit(std::uint32_t &n, int c, int base) {
        const int u = (c >= 'a' && c <= 'z') ? c - 32 : c;
        if (!hex(u)) return TPLEX_BAD_DIGIT;
        const std::uint32_t d = static_cast<std::uint32_t>(digit(u) ? u - '0' : u - 55);
        if (d >= static_cast<std::uint32_t>(base)) return TPLEX_BAD_DIGIT;
        n = n * static_cast<std::uint32_t>(base) + d;
        return 0;
    }
    std::int32_t literal(bool pdf) {
        rec.text.clear();
        std::int32_t result = 0;
        bool complete = false;
        while (result == 0 && !complete) {
            const int c = next_char();
            if (c == '"') {
                if (peek_char() == '"')
                    next_char();
                else if (!pdf)
                    complete = true;
                else if (peek_char() == '>')
                    next_char(), complete = true;
                else
                    result = TPLEX_BAD_PDF_STRING;
            }
            if (complete || result != 0) break;
            if (c == 0 || c == 255)
                result = TPLEX_END_OF_LINE_IN_STRING;
            else if (rec.text.size() < 2499)
                rec.text.push_back(static_cast<char>(c));
        }
        rec.kind = pdf ? 33 : 2;
        return complete ? rec.kind : result;
    }
    std::int32_t op(int v) {
        rec.kind = 3;
        rec.value = v;
        return 3;
    }
    std::int32_t number(int c, bool negative) {
        int base = 10;
        std::uint32_t n = 0;
        const int p = peek_char();
        if (c == '0' && (p == 'x' || p == 'X' || p == 'b' || p == 'B')) {
            base = (p == 'x' || p == 'X') ? 16 : 2;
            next_char();
            c = next_char();
        }
        std::int32_t result = add_digit(n, c, base);
        rec.text = c == 0 ? "" : std::string(1, static_cast<char>(c));
        while (result >= 0 && hex(peek_char())) {
            c = next_char();
            result = add_digit(n, c, base);
            if (rec.text.size() < 128) rec.text.push_back(static_cast<char>(c));
        }
        if (result < 0) {
            rec.value = static_cast<std::int32_t>(n);
            return result;
        }
        rec.kind = 1;
        rec.value = static_cast<std::int32_t>(negative ? 0u - n : n);
        return 1;
    }

    std::int32_t scan() {
        std::int32_t result = 0;
        bool negative = false;
        while (result == 0) {
            int c = next_char();
            if (letter(c)) {
                rec.text = std::string(1, static_cast<char>(c));
                word_rest();
                if (word_lookup() != 1) rec.kind = 10;
                if (rec.kind != 4)
                    result = rec.kind;
                else if (bodies.size() == 20)
                    result = TPLEX_TOO_MANY_MACRO_LEVELS;
                else
                    bodies.push_back(Body{rec.def1.substr(0, 2499), 0});
                continue;
            }
            if (digit(c)) {
                result = number(c, negative);
                continue;
            }
            switch (c) {
                case 0:
                case '\n':
                    result = 36;
                    break;
                case ' ':
                case '\t':
                    break;
                case 251:
                    do c = next_char();
                    while (c != 252 && c != 0 && c != 255);
                    break;
                case 253:
                    do c = next_char();
                    while (c != '\n' && c != 0 && c != 255);
                    break;
                case 255:
                    rec.kind = 5;
                    result = 5;
                    break;
                case '"':
                    result = literal(false);
                    break;
                case '\'':
                    c = next_char();
                    if (c == 0 || c == 255) {
                        result = TPLEX_END_OF_LINE_IN_CHAR;
                    } else {
                        rec.kind = 34;
                        rec.text = std::string(1, static_cast<char>(c));
                        result = next_char() == '\'' ? 34 : TPLEX_BAD_CHARACTER;
                    }
                    break;
                case '#':
                    c = next_char();
                    result = TPLEX_EXTRA_ENDIF;
                    if (ident(c)) {
                        rec.text = std::string(1, static_cast<char>(c));
                        rec.value = 0;
                        word_rest();
                        if (word_lookup() == 1 && rec.kind == 24) result = 24;
                    }
                    break;
                case '-':
                    if (digit(peek_char()))
                        negative = true;
                    else
                        result = op('-');
                    break;
                case '<': {
                    const int p = peek_char();
                    if (p == '=')
                        next_char(), result = op(5);
                    else if (p == '<')
                        next_char(), result = op(7);
                    else if (p == '"')
                        next_char(), result = literal(true);
                    else
                        result = op('<');
                    break;
                }
                case '>': {
                    const int p = peek_char();
                    if (p == '=')
                        next_char(), result = op(6);
                    else if (p == '>')
                        next_char(), result = op(8);
                    else
                        result = op('>');
                    break;
                }
                case '!':
                case '&':
                case '.':
                case '/':
                case '^':
                case '|': {
                    const int second = (c == '!' || c == '/') ? '=' : c;
                    const int pair = c == '!'   ? 11
                                     : c == '&' ? 4
                                     : c == '.' ? 9
                                     : c == '/' ? 2
                                     : c == '^' ? 10
                                                : 3;
                    if (peek_char() == second)
                        next_char(), result = op(pair);
                    else
                        result = op(c);
                    break;
                }
                case '%':
                case '(':
                case ')':
                case '*':
                case '+':
                case ',':
                case ':':
                case ';':
                case '=':
                case '[':
                case ']':
                case '{':
                case '}':
                case '~':
                    result = op(c);
                    break;
                default:
                    result = TPLEX_BAD_CHARACTER;
                    break;
            }
        }
        return result;
    }

    // ---- the directive filter (no #include: the inputs have none)
    bool live() const { return flags[depth] == 1; }

    std::int32_t define() {
        scan();
        std::string name = rec.text;
        const std::uint16_t name_kind = rec.kind;
        const std::int32_t r = scan();
        if (r == 36) {
            if (!live()) return 36;
            if (lookup(name) == 1) return TPLEX_UNEXPECTED_HASH_WORD;
            if (name_kind == 10) {
                if (tplex::dict_insert(25, 0, name.c_str()) == 0)
                    rec = Record{25, 0, name.substr(0, 128), rec.def1};
                return 36;
            }
            return name_kind != 25 ? TPLEX_BAD_HASH_WORD : 36;
        }
        if (lookup(name) == 1) return TPLEX_MACRO_REDEFINED;
        std::string body;
        std::int32_t last;
        for (bool first = true;; first = false) {
            const std::string spelled = spell();
            if (body.size() + spelled.size() + 2 >= 2500) return TPLEX_MACRO_TOO_LONG;
            const int k = rec.kind;
            if (!first && k != 1 && k != 2 && k != 3 && k != 9 && k != 10 && k != 33)
                return TPLEX_MACRO_BAD_TOKEN;
            body += spelled + " ";
            if ((last = scan()) == 36 || last == 5) break;
        }
        if (lookup(name) == 1) return TPLEX_MACRO_REDEFINED;
        if (live() && tplex::dict_insert(4, 0, name.c_str()) == 0) {
            rec = Record{4, 0, name.substr(0, 128), rec.def1};
            tplex::dict_extend(body.c_str(), "", "", 0, 0, 0);
        }
        return last;
    }

    // The record as body text that scans back to the same token.
    std::string spell() const {
        static const char *const pairs[] = {
            "/=", "||", "&&", "<=", ">=", "<<", ">>", "..", "^^", "!="};
        std::string quoted;
        switch (rec.kind) {
            case 1:
                for (const int base : {10, 16, 2}) {
                    std::uint32_t n = 0;
                    bool digits = !rec.text.empty();
                    for (const char c : rec.text) digits = digits && add_digit(n, c, base) == 0;
                    const std::string prefix = base == 16 ? "0x" : base == 2 ? "0b" : "";
                    const auto v = static_cast<std::uint32_t>(rec.value);
                    if (digits && (n == v || 0u - n == v))
                        return (n == v ? "" : "-") + prefix + rec.text;
                }
                return rec.text;
            case 2:
            case 33:
                for (const char c : rec.text) quoted += c == '"' ? "\"\"" : std::string(1, c);
                return rec.kind == 2 ? "\"" + quoted + "\"" : "<\"" + quoted + "\">";
            case 3:
                return rec.value >= 2 && rec.value <= 11
                           ? pairs[rec.value - 2]
                           : std::string(1, static_cast<char>(rec.value & 0xFF));
            case 34:
                return rec.text.size() == 1 ? "'" + rec.text + "'" : rec.text;
            default:
                return rec.text;
        }
    }

    std::int32_t directive() {
        std::int32_t result = 0;
        switch (rec.value) {
            case 201:
                return define();
            case 202:
            case 203: {
                const bool want_defined = rec.value == 202;
                std::uint8_t flag = 0;
                result = scan();
                if (live()) {
                    if (rec.kind == 10)
                        flag = want_defined ? 0 : 1;
                    else if (rec.kind == 25)
                        flag = want_defined ? 1 : 0;
                    else
                        result = TPLEX_BAD_HASH_WORD;
                }
                if (depth >= 20) return TPLEX_TOO_MANY_COND_LEVELS;
                flags[++depth] = flag;
                return result;
            }
            case 204:
                if (depth == 0) return TPLEX_EXTRA_ENDIF;
                --depth;
                return 0;
            default:
                return TPLEX_UNEXPECTED_HASH_WORD;
        }
    }

    std::int32_t filtered() {
        for (;;) {
            const std::int32_t r = scan();
            if (r == 24) {
                const std::int32_t d = directive();
                if (d < 0) return d;
            } else if (r == 5 || (r != 36 && live())) {
                return r;
            } else if (r == TPLEX_TOO_MANY_MACRO_LEVELS) {
                bodies.clear();  // in a dead region every pending body is abandoned
            }
        }
    }
};

// ------------------------------------------------------------ inputs

const std::vector<std::string> token_pieces = {
    "a",
    "b",
    "Zq",
    "x_1",
    "m1",
    "M2",
    "m3",
    "protocol",
    "define",
    "0",
    "7",
    "12",
    "0x",
    "0X1f",
    "0b",
    "0b10",
    "ff",
    "-",
    "- ",
    "-5",
    "+",
    "*",
    "/",
    "<",
    ">",
    "=",
    "!",
    "&",
    "|",
    "^",
    ".",
    "%",
    ",",
    ";",
    "(",
    "]",
    "~",
    "\"",
    "\"\"",
    "<\"",
    "\">",
    "'",
    "''",
    "/*",
    "*/",
    "//",
    "\n",
    "\n",
    " ",
    "  ",
    "\t",
    "#",
    "#endif",
    "#foo",
    "$",
    "?",
    "\r",
    "\xfb",
    "\xfc",
    "\xfd",
    "\xff",
    "\xfe",
    "\x80",
    "9999999999",
    "abcdefghij",
    ">=",
    ">>",
    std::string(1, '\0'),
    std::string(130, 'w'),
    std::string(300, 'w'),
};
const std::vector<std::string> directive_pieces = {
    "#define ", "define ", "#ifdef ", "#ifndef ", "#endif",   "endif ", "ifdef ", "k1",      "k2",
    "K3",       "m1",      "M2",      "5",        "0x1",      "\"s\"",  "\"\"",   "<\"p\">", "'c'",
    "+",        "<=",      "-",       "-1",       "protocol", "\n",     "\n",     "\n",      " ",
    " ",        "//",      "/*",      "*/",       "$",        "12ab",   "#foo",   "\xff",
};

std::string random_text(std::mt19937 &rng, const std::vector<std::string> &pieces, int max_pieces) {
    std::string out;
    for (int n = std::uniform_int_distribution<int>(0, max_pieces)(rng); n > 0; --n)
        out += pieces[rng() % pieces.size()];
    return out;
}

struct Case {
    std::string main, inner;  // inner: opened on top of main when with_inner
    bool with_inner = false;
    std::vector<std::string> bodies;  // bodies of M1, M2, M3 (kind 4)
    int pad = 0;                      // blanks before the main text, to reach the 4999 edge
    bool filtered = false;            // sc_next_token rather than scan_token
};

void define_bodies(const Case &c) {
    for (std::size_t i = 0; i < c.bodies.size(); ++i) {
        std::string name = "M" + std::to_string(i + 1);
        ASSERT_NE(tplex::dict_lookup(name.data()), 1);
        ASSERT_EQ(tplex::dict_insert(tk_macro, 0, name.c_str()), 0);
        ASSERT_EQ(tplex::dict_extend(c.bodies[i].c_str(), "", "", 0, 0, 0), 0);
    }
}

std::string show(std::int32_t r, std::uint16_t kind, std::int32_t value, const std::string &text) {
    char buf[64];
    std::snprintf(buf, sizeof buf, "r=%x kind=%u value=%d text=", static_cast<unsigned>(r), kind,
                  value);
    std::string out = buf;
    for (unsigned char ch : text) {
        if (ch >= 32 && ch < 127) {
            out.push_back(static_cast<char>(ch));
        } else {
            std::snprintf(buf, sizeof buf, "\\x%02x", ch);
            out += buf;
        }
    }
    return out;
}

// Runs a case through the model and through the library; the first
// difference of the two traces (and of the final region depth) fails it.
void check(const Case &c, const std::string &label) {
    TempDir dir;
    std::vector<std::string> paths{
        dir.write("main.src", std::string(static_cast<std::size_t>(c.pad), ' ') + c.main)};
    if (c.with_inner) paths.push_back(dir.write("inner.src", c.inner));
    std::vector<std::string> model, real;
    int model_depth = 0;
    {
        LexSession s;
        define_bodies(c);
        Model m(paths);
        for (int i = 0, ends = 0; i < 400 && ends < 2; ++i) {
            const std::int32_t r = c.filtered ? m.filtered() : m.scan();
            model.push_back(show(r, m.rec.kind, m.rec.value, m.rec.text));
            ends += r == 5;
        }
        model_depth = m.depth;
    }
    {
        LexSession s;
        define_bodies(c);
        ASSERT_EQ(sc_lex_init_file(paths[0].c_str()), 1);
        if (paths.size() > 1) {
            ASSERT_EQ(tplex::open_source_file(paths[1].c_str()), 2);
        }
        for (int i = 0, ends = 0; i < 400 && ends < 2; ++i) {
            const std::int32_t r = c.filtered ? sc_next_token() : tplex::scan_token();
            const token_record &t = tplex::current_token;
            real.push_back(show(r, t.kind, t.value, t.text));
            ends += r == 5;
        }
        EXPECT_EQ(static_cast<int>(tplex::cond_depth), model_depth) << label;
    }
    std::size_t i = 0;
    while (i < model.size() && i < real.size() && model[i] == real[i]) ++i;
    if (i == model.size() && i == real.size()) return;
    ADD_FAILURE() << label << ": first difference at call " << i
                  << "\n  model: " << (i < model.size() ? model[i] : "(none)")
                  << "\n  real:  " << (i < real.size() ? real[i] : "(none)")
                  << "\n  main: " << show(0, 0, 0, c.main)
                  << "\n  inner: " << show(0, 0, 0, c.inner);
}

TEST(ScannerModel, GeneratedInputs) {
    std::mt19937 rng(20261206);
    for (int n = 0; n < 1500 && !HasFailure(); ++n) {
        Case c;
        c.main = random_text(rng, token_pieces, 40);
        c.with_inner = rng() % 3 == 0;
        if (c.with_inner) c.inner = random_text(rng, token_pieces, 15);
        for (int b = static_cast<int>(rng() % 4); b > 0; --b)
            c.bodies.push_back(random_text(rng, token_pieces, 8));
        check(c, "case " + std::to_string(n));
    }
}

TEST(ScannerModel, AtTheEdgeOfA4999Piece) {
    std::mt19937 rng(4999);
    for (int n = 0; n < 300 && !HasFailure(); ++n) {
        Case c;
        c.pad = 4999 - static_cast<int>(rng() % 6);
        c.main = random_text(rng, token_pieces, 12);
        for (int b = static_cast<int>(rng() % 3); b > 0; --b)
            c.bodies.push_back(random_text(rng, token_pieces, 6));
        check(c, "case " + std::to_string(n));
    }
}

TEST(ScannerModel, BodiesThatNameThemselves) {
    check(Case{"m1 m2 m3 x", "", false, {"m1 ", "a m2", "m1 m3"}}, "recursive");
}

TEST(FilterModel, GeneratedDirectives) {
    std::mt19937 rng(201205);
    for (int n = 0; n < 2000 && !HasFailure(); ++n) {
        Case c;
        c.main = random_text(rng, directive_pieces, 60);
        c.filtered = true;
        check(c, "case " + std::to_string(n));
    }
}

}  // namespace
