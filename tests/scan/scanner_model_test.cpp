// scan_token and sc_next_token against a literal model of the character
// source, the scanner and the directive filter as the behaviour
// description states them (one character at a
// time through read_char, peek_char and next_char), on generated inputs:
// files, an included file, bodies of names defined with a body, long lines,
// NUL bytes and the marker bytes. Whatever the scanner does to be fast, its
// tokens and records must be the model's.
#include <gtest/gtest.h>

#include <cstdio>
#include <cstring>
#include <random>
#include <string>
#include <vector>

#include "dict/dictionary.h"
#include "lex/lexer.h"
#include "lex_harness.h"
#include "scan/scanner.h"
#include "scan/directives.h"
#include "source/source_stack.h"

using tplex::test::LexSession;
using tplex::test::TempDir;

namespace {

// ------------------------------------------------------------ the model

struct Record {
    std::uint16_t kind;
    std::int32_t value;
    std::string text;
    std::string def1;
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
        std::uint32_t line_no = 0xFFFFFFFFu;
        bool ended = false;  // a 0x1A byte ends the file for good
    };

    // One line in text mode, a character at a time: CR LF arrives as LF,
    // 0x1A ends the file, at most 4999 characters, stopping after a LF.
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
    std::vector<Body> bodies;
    std::vector<File> files;
    Record rec;
    bool pushed_back = false;

    ~Model() {
        for (File &f : files)
            if (f.f != nullptr) std::fclose(f.f);
    }

    int read_char() {
        while (!bodies.empty() && bodies.back().pos > bodies.back().text.size()) bodies.pop_back();
        if (!bodies.empty()) {
            Body &b = bodies.back();
            const int c = b.pos < b.text.size() ? static_cast<unsigned char>(b.text[b.pos]) : 0;
            ++b.pos;
            return c;
        }
        if (files.empty()) return 255;
        File *f = &files.back();
        if (f->line_no == 0xFFFFFFFFu || f->line[f->pos] == 0) {
            while (!read_line(*f)) {
                std::fclose(f->f);
                files.pop_back();
                if (files.empty()) return 255;
                f = &files.back();
            }
            ++f->line_no;
            f->pos = 0;
        }
        const int c = static_cast<unsigned char>(f->line[f->pos]);
        if (c == 0) return 0;
        ++f->pos;
        return c;
    }

    int peek_char() const {
        if (!bodies.empty()) {
            const Body &b = bodies.back();
            return b.pos < b.text.size() ? static_cast<unsigned char>(b.text[b.pos]) : ' ';
        }
        if (!files.empty()) {
            const File &f = files.back();
            return f.line[f.pos] != 0 ? static_cast<unsigned char>(f.line[f.pos]) : ' ';
        }
        return ' ';
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

    // dict_lookup of the record's text, copied into the record.
    int lookup() {
        char name[2500];
        std::snprintf(name, sizeof name, "%s", rec.text.c_str());
        const int r = tplex::dict_lookup(name);
        rec.text = name;
        if (r == 1) {
            rec.kind = tplex::current_token.kind;
            rec.value = tplex::current_token.value;
            if (tplex::current_token.has_definition) rec.def1 = tplex::current_token.def_text1;
        }
        return r;
    }

    void word_rest() {
        while (ident(peek_char())) {
            const int c = next_char();
            if (rec.text.size() < 128) rec.text.push_back(static_cast<char>(c));
        }
    }

    static std::int32_t add_digit(std::uint32_t &n, int c, int base) {
        std::uint32_t d;
        if (digit(c)) {
            d = static_cast<std::uint32_t>(c - '0');
        } else {
            const int u = (c >= 'a' && c <= 'z') ? c - 32 : c;
            if (!hex(u)) return TPLEX_BAD_DIGIT;
            d = static_cast<std::uint32_t>(u - 55);
        }
        if (d >= static_cast<std::uint32_t>(base)) return TPLEX_BAD_DIGIT;
        n = n * static_cast<std::uint32_t>(base) + d;
        return 0;
    }

    std::int32_t literal(bool pdf) {
        rec.text.clear();
        std::int32_t result = 0;
        bool complete = false;
        while (result == 0 && !complete) {
            int c = next_char();
            if (c == '"') {
                if (peek_char() == '"') {
                    next_char();
                } else if (!pdf) {
                    complete = true;
                } else if (peek_char() == '>') {
                    next_char();
                    complete = true;
                } else {
                    result = TPLEX_BAD_PDF_STRING;
                }
            }
            if (!complete && result == 0) {
                if (c == 0 || c == 255)
                    result = TPLEX_END_OF_LINE_IN_STRING;
                else if (rec.text.size() < 2499)
                    rec.text.push_back(static_cast<char>(c));
            }
        }
        rec.kind = pdf ? 33 : 2;
        return complete ? rec.kind : result;
    }

    std::int32_t op(int v) {
        rec.kind = 3;
        rec.value = v;
        return 3;
    }

    std::int32_t scan() {
        if (pushed_back) {
            pushed_back = false;
            return rec.kind;
        }
        std::int32_t result = 0;
        bool negative = false;
        while (result == 0) {
            int c = next_char();
            if (letter(c)) {
                rec.text = std::string(1, static_cast<char>(c));
                word_rest();
                if (lookup() != 1) rec.kind = 10;
                if (rec.kind == 4) {
                    if (bodies.size() == 20) {
                        result = TPLEX_TOO_MANY_MACRO_LEVELS;
                    } else {
                        bodies.push_back(Body{rec.def1.substr(0, 2499), 0});
                    }
                } else {
                    result = rec.kind;
                }
            } else if (digit(c)) {
                int base = 10;
                std::uint32_t n = 0;
                const int p = peek_char();
                if (c == '0' && (p == 'x' || p == 'X' || p == 'b' || p == 'B')) {
                    base = (p == 'x' || p == 'X') ? 16 : 2;
                    next_char();
                    c = next_char();
                }
                result = add_digit(n, c, base);
                rec.text = std::string(1, static_cast<char>(c));
                if (c == 0) rec.text.clear();
                while (result >= 0 && hex(peek_char())) {
                    c = next_char();
                    result = add_digit(n, c, base);
                    if (rec.text.size() < 128) rec.text.push_back(static_cast<char>(c));
                }
                if (result >= 0) {
                    rec.kind = 1;
                    result = 1;
                    rec.value = static_cast<std::int32_t>(negative ? 0u - n : n);
                } else {
                    rec.value = static_cast<std::int32_t>(n);
                }
            } else {
                switch (c) {
                    case 0: case '\n': result = 36; break;
                    case ' ': case '\t': break;
                    case 251: do c = next_char(); while (c != 252 && c != 0 && c != 255); break;
                    case 253: do c = next_char(); while (c != '\n' && c != 0 && c != 255); break;
                    case 255: rec.kind = 5; result = 5; break;
                    case '"': result = literal(false); break;
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
                        if (!ident(c)) {
                            result = TPLEX_EXTRA_ENDIF;
                        } else {
                            rec.text = std::string(1, static_cast<char>(c));
                            rec.value = 0;
                            word_rest();
                            result = (lookup() == 1 && rec.kind == 24) ? 24 : TPLEX_EXTRA_ENDIF;
                        }
                        break;
                    case '-':
                        if (digit(peek_char())) negative = true;
                        else result = op('-');
                        break;
                    case '<': {
                        const int p = peek_char();
                        if (p == '=') { next_char(); result = op(5); }
                        else if (p == '<') { next_char(); result = op(7); }
                        else if (p == '"') { next_char(); result = literal(true); }
                        else result = op('<');
                        break;
                    }
                    case '>': {
                        const int p = peek_char();
                        if (p == '=') { next_char(); result = op(6); }
                        else if (p == '>') { next_char(); result = op(8); }
                        else result = op('>');
                        break;
                    }
                    case '!': case '&': case '.': case '/': case '^': case '|': {
                        const int second = c == '!' ? '=' : c == '/' ? '=' : c;
                        const int pair = c == '!' ? 11 : c == '&' ? 4 : c == '.' ? 9 : c == '/' ? 2 : c == '^' ? 10 : 3;
                        if (peek_char() == second) { next_char(); result = op(pair); }
                        else result = op(c);
                        break;
                    }
                    case '%': case '(': case ')': case '*': case '+': case ',': case ':': case ';':
                    case '=': case '[': case ']': case '{': case '}': case '~':
                        result = op(c);
                        break;
                    default: result = TPLEX_BAD_CHARACTER; break;
                }
            }
        }
        // The model's own record text is upper case for words (lookup did it).
        return result;
    }

    // ---- the preprocessing layer (no #include: the inputs have none)
    std::uint8_t flags[21] = {1};
    int depth = 0;
    bool live() const { return flags[depth] == 1; }

    int lookup_name(std::string &name) {
        char buf[2500];
        std::snprintf(buf, sizeof buf, "%s", name.c_str());
        const int r = tplex::dict_lookup(buf);
        name = buf;
        if (r == 1) {
            rec.kind = tplex::current_token.kind;
            rec.value = tplex::current_token.value;
            rec.text = tplex::current_token.text;
            if (tplex::current_token.has_definition) rec.def1 = tplex::current_token.def_text1;
        }
        return r;
    }
    void insert(std::uint8_t kind, std::int16_t code, const std::string &name) {
        if (tplex::dict_insert(kind, code, name.c_str()) == 0) {
            rec.kind = kind;
            rec.value = code;
            rec.text = name.substr(0, 128);
        }
    }

    std::int32_t define() {
        scan();
        std::string name = rec.text;
        const std::uint16_t name_kind = rec.kind;
        const std::int32_t r = scan();
        if (r == 36) {
            if (!live()) return 36;
            if (lookup_name(name) == 1) return TPLEX_UNEXPECTED_HASH_WORD;
            if (name_kind == 10) {
                insert(25, 0, name);
                return 36;
            }
            return name_kind != 25 ? TPLEX_BAD_HASH_WORD : 36;
        }
        if (lookup_name(name) == 1) return TPLEX_MACRO_REDEFINED;
        std::string body;
        if (rec.kind == 2) {
            if (rec.text.size() + 3 > 2499) return TPLEX_MACRO_TOO_LONG;
            body = "\"" + rec.text + "\" ";
        } else {
            if (rec.text.size() + 1 > 2499) return TPLEX_MACRO_TOO_LONG;
            body = rec.text + " ";
        }
        std::int32_t last;
        for (;;) {
            last = scan();
            if (last == 36 || last == 5) break;
            if (body.size() + rec.text.size() + 2 >= 2500) return TPLEX_MACRO_TOO_LONG;
            switch (rec.kind) {
                case 1: case 2: case 9: case 10: case 33: body += rec.text; break;
                case 3: body.push_back(static_cast<char>(rec.value & 0xFF)); break;
                default: return TPLEX_MACRO_BAD_TOKEN;
            }
            body += " ";
        }
        if (lookup_name(name) == 1) return TPLEX_MACRO_REDEFINED;
        if (live()) {
            if (tplex::dict_insert(4, 0, name.c_str()) == 0) {
                rec.kind = 4;
                rec.value = 0;
                rec.text = name.substr(0, 128);
                tplex::dict_extend(body.c_str(), "", "", 0, 0, 0);
            }
        }
        return last;
    }

    std::int32_t directive() {
        std::int32_t result = 0;
        bool push = false;
        std::uint8_t flag = 0;
        switch (static_cast<std::uint32_t>(rec.value) - 201u) {
            case 0: result = define(); break;
            case 1:
            case 2: {
                const bool want_defined = rec.value == 202;
                push = true;
                result = scan();
                if (live()) {
                    if (rec.kind == 10) flag = want_defined ? 0 : 1;
                    else if (rec.kind == 25) flag = want_defined ? 1 : 0;
                    else result = TPLEX_BAD_HASH_WORD;
                }
                break;
            }
            case 3:
                if (depth > 0) --depth;
                else result = TPLEX_EXTRA_ENDIF;
                break;
            case 4: result = -1; break;  // not generated
            default: result = TPLEX_UNEXPECTED_HASH_WORD; break;
        }
        if (push) {
            if (depth >= 20) result = TPLEX_TOO_MANY_COND_LEVELS;
            else flags[++depth] = flag;
        }
        return result;
    }

    std::int32_t filtered() {
        for (;;) {
            const std::int32_t r = scan();
            if (r == 24) {
                const std::int32_t d = directive();
                if (d < 0) return d;
                continue;
            }
            if (r == 5) return 5;
            if (r == 36) continue;
            if (live()) return r;
        }
    }
};

// ------------------------------------------------------------ inputs

const char *const pieces[] = {
    "a", "b", "Zq", "x_1", "m1", "M2", "m3", "protocol", "define", "0", "7", "12", "0x", "0X1f", "0b",
    "0b10", "ff", "-", "- ", "-5", "+", "*", "/", "<", ">", "=", "!", "&", "|", "^", ".", "%", ",",
    ";", "(", "]", "~", "\"", "\"\"", "<\"", "\">", "'", "''", "/*", "*/", "//", "\n", "\n", " ",
    "  ", "\t", "#", "#endif", "#foo", "$", "?", "\r", "\xfb", "\xfc", "\xfd", "\xff", "\xfe", "\x80",
    "9999999999", "abcdefghij",
};

std::string random_text(std::mt19937 &rng, int max_pieces) {
    std::uniform_int_distribution<int> count(0, max_pieces);
    std::uniform_int_distribution<std::size_t> pick(0, sizeof pieces / sizeof pieces[0] + 2);
    std::string out;
    const int n = count(rng);
    for (int i = 0; i < n; ++i) {
        const std::size_t k = pick(rng);
        if (k < sizeof pieces / sizeof pieces[0])
            out += pieces[k];
        else if (k == sizeof pieces / sizeof pieces[0])
            out.push_back('\0');
        else
            out += std::string(std::uniform_int_distribution<int>(1, 300)(rng), 'w');
    }
    return out;
}

struct Case {
    std::string main, inner;        // inner: opened on top of main when not empty
    std::vector<std::string> bodies; // bodies of M1, M2, M3 (kind 4)
    int pad = 0;                     // blanks before the main text, to reach the 4999 edge
};

void define_bodies(const Case &c) {
    for (std::size_t i = 0; i < c.bodies.size(); ++i) {
        std::string name = "M" + std::to_string(i + 1);
        ASSERT_NE(tplex::dict_lookup(name.data()), 1);
        ASSERT_EQ(tplex::dict_insert(tk_macro, 0, name.c_str()), 0);
        ASSERT_EQ(tplex::dict_extend(c.bodies[i].c_str(), "", "", 0, 0, 0), 0);
    }
}

std::string show(std::int32_t r, const Record &rec) {
    char buf[64];
    std::snprintf(buf, sizeof buf, "r=%x kind=%u value=%d text=", static_cast<unsigned>(r), rec.kind, rec.value);
    std::string out = buf;
    for (unsigned char ch : rec.text) {
        if (ch >= 32 && ch < 127) {
            out.push_back(static_cast<char>(ch));
        } else {
            std::snprintf(buf, sizeof buf, "\\x%02x", ch);
            out += buf;
        }
    }
    return out;
}

// Runs a case through the model and through scan_token; the two traces.
void run(const Case &c, std::vector<std::string> &model_trace, std::vector<std::string> &real_trace) {
    TempDir dir;
    const std::string main = dir.write("main.src", std::string(static_cast<std::size_t>(c.pad), ' ') + c.main);
    const std::string inner = dir.write("inner.src", c.inner);
    const int calls = 400;
    {
        LexSession s;
        define_bodies(c);
        Model m;
        m.rec = Record{tplex::current_token.kind, tplex::current_token.value, tplex::current_token.text,
                       tplex::current_token.def_text1};
        m.files.emplace_back();
        m.files.back().f = std::fopen(main.c_str(), "r");
        if (!c.inner.empty()) {
            m.files.emplace_back();
            m.files.back().f = std::fopen(inner.c_str(), "r");
        }
        int ends = 0;
        for (int i = 0; i < calls && ends < 2; ++i) {
            const std::int32_t r = m.scan();
            model_trace.push_back(show(r, m.rec));
            ends += r == 5;
        }
    }
    {
        LexSession s;
        define_bodies(c);
        ASSERT_EQ(sc_lex_init_file(main.c_str()), 1);
        if (!c.inner.empty()) {
            ASSERT_EQ(tplex::open_source_file(inner.c_str()), 2);
        }
        int ends = 0;
        for (int i = 0; i < calls && ends < 2; ++i) {
            const std::int32_t r = tplex::scan_token();
            const token_record &t = tplex::current_token;
            real_trace.push_back(show(r, Record{t.kind, t.value, t.text, ""}));
            ends += r == 5;
        }
    }
}

void check(const Case &c, const std::string &label) {
    std::vector<std::string> model, real;
    run(c, model, real);
    std::size_t i = 0;
    while (i < model.size() && i < real.size() && model[i] == real[i]) ++i;
    if (i == model.size() && i == real.size()) return;
    ADD_FAILURE() << label << ": first difference at call " << i << "\n  model: "
                  << (i < model.size() ? model[i] : "(none)") << "\n  real:  "
                  << (i < real.size() ? real[i] : "(none)") << "\n  main: " << show(0, Record{0, 0, c.main, ""})
                  << "\n  inner: " << show(0, Record{0, 0, c.inner, ""});
}

TEST(ScannerModel, GeneratedInputs) {
    std::mt19937 rng(20261206);
    for (int n = 0; n < 1500; ++n) {
        Case c;
        c.main = random_text(rng, 40);
        if (rng() % 3 == 0) c.inner = random_text(rng, 15);
        const int bodies = static_cast<int>(rng() % 4);
        for (int b = 0; b < bodies; ++b) c.bodies.push_back(random_text(rng, 8));
        check(c, "case " + std::to_string(n));
        if (HasFailure()) return;
    }
}

TEST(ScannerModel, AtTheEdgeOfA4999Piece) {
    std::mt19937 rng(4999);
    for (int n = 0; n < 300; ++n) {
        Case c;
        c.pad = 4999 - static_cast<int>(rng() % 6);
        c.main = random_text(rng, 12);
        const int bodies = static_cast<int>(rng() % 3);
        for (int b = 0; b < bodies; ++b) c.bodies.push_back(random_text(rng, 6));
        check(c, "case " + std::to_string(n));
        if (HasFailure()) return;
    }
}

TEST(ScannerModel, BodiesThatNameThemselves) {
    Case c;
    c.main = "m1 m2 m3 x";
    c.bodies = {"m1 ", "a m2", "m1 m3"};
    check(c, "recursive");
}


const char *const directive_pieces[] = {
    "#define ", "define ", "#ifdef ", "#ifndef ", "#endif", "endif ", "ifdef ", "k1", "k2", "K3", "m1", "M2",
    "5", "0x1", "\"s\"", "\"\"", "<\"p\">", "'c'", "+", "<=", "-", "-1", "protocol", "\n", "\n", "\n", " ",
    " ", "//", "/*", "*/", "$", "12ab", "#foo", "\xff",
};

std::string random_directives(std::mt19937 &rng, int max_pieces) {
    std::uniform_int_distribution<int> count(0, max_pieces);
    std::uniform_int_distribution<std::size_t> pick(0, sizeof directive_pieces / sizeof directive_pieces[0] - 1);
    std::string out;
    const int n = count(rng);
    for (int i = 0; i < n; ++i) out += directive_pieces[pick(rng)];
    return out;
}

TEST(FilterModel, GeneratedDirectives) {
    std::mt19937 rng(201205);
    for (int n = 0; n < 2000; ++n) {
        const std::string text = random_directives(rng, 60);
        std::vector<std::string> model_trace, real_trace;
        int model_depth = 0;
        {
            TempDir dir;
            const std::string main = dir.write("main.src", text);
            LexSession s;
            Model m;
            m.rec = Record{tplex::current_token.kind, tplex::current_token.value, tplex::current_token.text,
                           tplex::current_token.def_text1};
            m.files.emplace_back();
            m.files.back().f = std::fopen(main.c_str(), "r");
            int ends = 0;
            for (int i = 0; i < 300 && ends < 2; ++i) {
                const std::int32_t r = m.filtered();
                model_trace.push_back(show(r, m.rec));
                ends += r == 5;
            }
            model_depth = m.depth;
        }
        {
            TempDir dir;
            const std::string main = dir.write("main.src", text);
            LexSession s;
            ASSERT_EQ(sc_lex_init_file(main.c_str()), 1);
            int ends = 0;
            for (int i = 0; i < 300 && ends < 2; ++i) {
                const std::int32_t r = sc_next_token();
                const token_record &t = tplex::current_token;
                real_trace.push_back(show(r, Record{t.kind, t.value, t.text, ""}));
                ends += r == 5;
            }
            EXPECT_EQ(static_cast<int>(tplex::cond_depth), model_depth) << "case " << n;
        }
        std::size_t i = 0;
        while (i < model_trace.size() && i < real_trace.size() && model_trace[i] == real_trace[i]) ++i;
        if (i != model_trace.size() || i != real_trace.size()) {
            ADD_FAILURE() << "case " << n << ": first difference at call " << i << "\n  model: "
                          << (i < model_trace.size() ? model_trace[i] : "(none)") << "\n  real:  "
                          << (i < real_trace.size() ? real_trace[i] : "(none)") << "\n  text: "
                          << show(0, Record{0, 0, text, ""});
            return;
        }
        if (HasFailure()) return;
    }
}

}  // namespace
