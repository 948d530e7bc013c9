// Corpus generator for the lexer benchmark.
//
// Writes deterministic source text in the protocol and state-machine language
// (system, protocol and process blocks) and, beside it, the token stream that
// a conforming lexer must deliver for it, reduced to a token count and the
// benchmark checksum (bench_common.h). Variants:
//   plain      LF line ends, no directives: every scanner must agree on it;
//   crlf       the plain text with CR LF line ends (same tokens);
//   directive  defines used often, nested #ifdef/#ifndef regions and
//              #include of generated files (written beside the main file);
//   dense, dense5k, numbers, short
//              token mixes (see Mix below): lines of tokens drawn by share,
//              LF line ends, no directives; every scanner must agree on them.
//
// The text keeps clear of the corners where scanners may honestly differ:
// no "/*", "*/" or "//" inside strings, no "*/" outside comments, no "/" or
// "*" inside comments, a blank or a bracket between tokens that could touch,
// lines far below 4999 characters, words and numbers below 128 characters and
// strings below 2499.
//
// Usage: corpus_gen --variant VARIANT --size N[K|M] --seed S --out FILE

#include <algorithm>
#include <cinttypes>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <string>
#include <unordered_map>
#include <unordered_set>
#include <utility>
#include <vector>

extern "C" {
#include "bench_common.h"
#include "reserved_words.h"
}

namespace {

constexpr uint8_t kNumber = 1;
constexpr uint8_t kString = 2;
constexpr uint8_t kOperator = 3;
constexpr uint8_t kReserved = 9;
constexpr uint8_t kIdentifier = 10;
constexpr uint8_t kHashDefinition = 25;
constexpr uint8_t kPdfString = 33;
constexpr uint8_t kChar = 34;

// ---------------------------------------------------------------------------
// Randomness: splitmix64, so that a seed gives the same corpus everywhere.

class Rng {
public:
    explicit Rng(uint64_t seed) : state_(seed) {}
    uint64_t next() {
        uint64_t z = (state_ += 0x9E3779B97F4A7C15ull);
        z = (z ^ (z >> 30)) * 0xBF58476D1CE4E5B9ull;
        z = (z ^ (z >> 27)) * 0x94D049BB133111EBull;
        return z ^ (z >> 31);
    }
    uint32_t below(uint32_t n) { return static_cast<uint32_t>(((next() >> 32) * n) >> 32); }
    int range(int lo, int hi) { return lo + static_cast<int>(below(hi - lo + 1)); }
    bool percent(unsigned p) { return below(100) < p; }
    bool permille(unsigned p) { return below(1000) < p; }
    template <class T>
    const T &pick(const std::vector<T> &v) {
        return v[below(static_cast<uint32_t>(v.size()))];
    }

private:
    uint64_t state_;
};

// ---------------------------------------------------------------------------
// The expected token stream.

struct Token {
    uint8_t kind;
    int32_t value;
    std::string text;
};

// Receives expected tokens: hashes them and, for an include file, keeps them
// so that each live #include can replay them into the includer's stream.
class Sink {
public:
    explicit Sink(bool keep) : keep_(keep) { bench_begin(&sum_, 0, nullptr); }
    void add(const Token &t) {
        bench_token(&sum_, t.kind, t.value, t.text.data(), t.text.size());
        if (keep_) tokens_.push_back(t);
    }
    void replay(const std::vector<Token> &tokens) {
        for (const Token &t : tokens) add(t);
    }
    uint64_t count() const { return sum_.tokens; }
    uint64_t hash() const { return sum_.hash; }
    const std::vector<Token> &tokens() const { return tokens_; }

private:
    bench_sink sum_;
    bool keep_;
    std::vector<Token> tokens_;
};

std::string upper(const std::string &s) {
    std::string u = s;
    for (char &c : u)
        if (c >= 'a' && c <= 'z') c = static_cast<char>(c - 'a' + 'A');
    return u;
}

// Reserved words that a scanner looks up (those beginning with a letter).
const std::unordered_map<std::string, int> &reserved_codes() {
    static const std::unordered_map<std::string, int> codes = [] {
        std::unordered_map<std::string, int> m;
        for (int i = 0; i < BENCH_RESERVED_WORD_COUNT; i++) {
            const char *w = bench_reserved_words[i];
            if (w[0] >= 'A' && w[0] <= 'Z') m.emplace(w, i);
        }
        return m;
    }();
    return codes;
}

int reserved_code(const char *word) {
    auto it = reserved_codes().find(word);
    if (it == reserved_codes().end()) {
        std::fprintf(stderr, "corpus_gen: %s is no reserved word\n", word);
        std::exit(2);
    }
    return it->second;
}

bool is_hash_word(const std::string &u) {
    return u == "DEFINE" || u == "IFDEF" || u == "IFNDEF" || u == "ENDIF" || u == "INCLUDE";
}

int operator_code(const char *op) {
    static const char *const pairs[] = {"/=", "||", "&&", "<=", ">=", "<<", ">>", "..", "^^", "!="};
    if (op[1] != '\0') {
        for (int i = 0; i < 10; i++)
            if (std::strcmp(op, pairs[i]) == 0) return i + 2;
        std::fprintf(stderr, "corpus_gen: unknown operator %s\n", op);
        std::exit(2);
    }
    return static_cast<unsigned char>(op[0]);
}

// ---------------------------------------------------------------------------
// Writer: the source text and, in step, the tokens it must yield.

class Writer {
public:
    Writer(FILE *out, bool crlf, Sink *sink) : out_(out), crlf_(crlf), sink_(sink) {}
    ~Writer() { flush(); }

    // Tokens are delivered only in live regions (conditional compilation).
    void set_live(bool live) { live_ = live; }
    bool live() const { return live_; }
    uint64_t bytes() const { return bytes_ + pending_bytes(); }
    // Bytes before CR LF conversion: the two line-end variants stop alike.
    uint64_t text_bytes() const { return text_bytes_ + buf_.size(); }

    void expect(const Token &t) {
        if (live_) sink_->add(t);
    }
    void replay(const std::vector<Token> &tokens) {
        if (live_) sink_->replay(tokens);
    }

    // A token's text, with a blank before it unless it may touch the one before.
    void token_text(const std::string &s, bool glue_left) {
        if (!line_start_ && !after_opener_ && !glue_left) put(' ');
        put(s);
        line_start_ = false;
        after_opener_ = false;
    }

    void word(const std::string &written) {
        std::string u = upper(written);
        auto it = reserved_codes().find(u);
        token_text(written, false);
        if (it != reserved_codes().end())
            expect(Token{kReserved, it->second, u});
        else
            expect(Token{kIdentifier, 0, u});
    }

    void op(const char *s, bool glue_left = false) {
        bool glue = glue_left || std::strchr(")]},;", s[0]) != nullptr;
        token_text(s, glue);
        if (s[1] == '\0' && std::strchr("([{", s[0]) != nullptr) after_opener_ = true;
        expect(Token{kOperator, operator_code(s), std::string()});
    }

    void number(const std::string &prefix, const std::string &digits, unsigned base,
                bool negative) {
        uint32_t v = 0;
        for (char c : digits) {
            unsigned d = (c >= '0' && c <= '9') ? static_cast<unsigned>(c - '0')
                                                : static_cast<unsigned>((c | 0x20) - 'a' + 10);
            v = v * base + d;
        }
        if (negative) v = 0u - v;
        token_text((negative ? "-" : "") + prefix + digits, false);
        expect(Token{kNumber, static_cast<int32_t>(v), digits});
    }

    // Strings and PDF strings: a doubled quote in the source stands for one.
    void string_lit(const std::string &content, bool pdf) {
        std::string src = pdf ? "<\"" : "\"";
        for (char c : content) {
            if (c == '"') src += '"';
            src += c;
        }
        src += pdf ? "\">" : "\"";
        token_text(src, false);
        expect(Token{pdf ? kPdfString : kString, 0, content});
    }

    void char_lit(char c) {
        token_text(std::string("'") + c + "'", false);
        expect(Token{kChar, 0, std::string(1, c)});
    }

    // A name of kind 25 (defined without a body) used as a token.
    void hash_definition(const std::string &name) {
        token_text(name, false);
        expect(Token{kHashDefinition, 0, upper(name)});
    }

    // Text that is no token: comments, directives, indentation.
    void raw(const std::string &s) {
        put(s);
        if (!s.empty()) line_start_ = s.back() == '\n';
        after_opener_ = false;
    }
    void blank() {
        if (!line_start_) put(' ');
    }
    void newline() {
        put('\n');
        line_start_ = true;
        after_opener_ = false;
    }
    void indent(int level) {
        for (int i = 0; i < level; i++) put(tab_indent_ ? "\t" : "    ");
        line_start_ = true;
    }
    void set_tab_indent(bool tabs) { tab_indent_ = tabs; }
    // The next token touches this one ("a.b").
    void glue_next() { after_opener_ = true; }

    void flush() {
        if (buf_.empty() || out_ == nullptr) return;
        text_bytes_ += buf_.size();
        if (crlf_) {
            std::string t;
            t.reserve(buf_.size() + buf_.size() / 16);
            for (char c : buf_) {
                if (c == '\n') t += '\r';
                t += c;
            }
            std::fwrite(t.data(), 1, t.size(), out_);
            bytes_ += t.size();
        } else {
            std::fwrite(buf_.data(), 1, buf_.size(), out_);
            bytes_ += buf_.size();
        }
        buf_.clear();
        newlines_ = 0;
    }

private:
    void put(char c) {
        buf_ += c;
        if (c == '\n') newlines_++;
        if (buf_.size() >= (1u << 20)) flush();
    }
    void put(const std::string &s) {
        for (char c : s) put(c);
    }
    uint64_t pending_bytes() const { return buf_.size() + (crlf_ ? newlines_ : 0); }

    FILE *out_;
    bool crlf_;
    Sink *sink_;
    bool live_ = true;
    bool line_start_ = true;
    bool after_opener_ = false;
    bool tab_indent_ = false;
    std::string buf_;
    uint64_t bytes_ = 0;
    uint64_t text_bytes_ = 0;
    uint64_t newlines_ = 0;
};

// ---------------------------------------------------------------------------
// Vocabulary: identifiers with a Zipf-like use (a few hot, most rare).

class Vocabulary {
public:
    // `size` distinct names of min_len to max_len characters, drawn from
    // roots, prefixes and suffixes; the defaults are the language corpora's.
    explicit Vocabulary(Rng &rng, size_t size = 950, size_t min_len = 1, size_t max_len = 120) {
        static const char *const roots[] = {
            "link",    "setup",   "release", "ack",      "data",   "conn",    "hdr",      "seq",
            "addr",    "port",    "chan",    "retry",    "frame",  "octet",   "flag",     "mode",
            "cause",   "reason",  "result",  "status",   "param",  "count",   "offset",   "peer",
            "node",    "call",    "session", "credit",   "buffer", "queue",   "event",    "idle",
            "busy",    "wait",    "ready",   "alarm",    "config", "unit",    "slot",     "cell",
            "trunk",   "line",    "digit",   "tone",     "cmd",    "resp",    "req",      "ind",
            "cnf",     "poll",    "final",   "nr",       "ns",     "tei",     "sapi",     "dlci",
            "vpi",     "vci",     "pdu",     "sdu",      "rx",     "tx",      "err",      "fault",
            "reset",   "restart", "connect", "disc",     "alert",  "proceed", "progress", "notify",
            "suspend", "resume",  "info",    "facility", "bearer", "channel", "called",   "calling",
            "party",   "number",  "subaddr", "display",  "keypad", "signal",  "cause",    "state",
            "timer",   "guard",   "hold",    "transfer", "conf",   "mute",    "level",    "gain",
            "codec",   "rate",    "clock",   "sync",     "phase",  "epoch",   "tick",     "budget",
            "quota"};
        static const char *const prefixes[] = {
            "",     "",     "",     "sig_", "st_", "t_",    "m_",    "f_",   "p_",   "tmr_",
            "cnt_", "max_", "min_", "num_", "is_", "last_", "next_", "cur_", "old_", "new_"};
        static const char *const suffixes[] = {
            "",  "",  "",  "",   "_req", "_ind", "_rsp", "_cnf", "_id",  "_len", "_lo",  "_hi",
            "1", "2", "3", "_a", "_b",   "_ext", "_v2",  "_tbl", "_ptr", "_max", "_min", "_mask"};
        const size_t nr = sizeof roots / sizeof roots[0];
        const size_t np = sizeof prefixes / sizeof prefixes[0];
        const size_t ns = sizeof suffixes / sizeof suffixes[0];
        std::unordered_set<std::string> seen;
        while (names_.size() < size) {
            std::string n = prefixes[rng.below(np)];
            int parts = rng.percent(70) ? 1 : (rng.percent(80) ? 2 : 3);
            for (int i = 0; i < parts; i++) {
                if (i > 0) n += '_';
                n += roots[rng.below(nr)];
            }
            n += suffixes[rng.below(ns)];
            if (names_.size() % 97 == 13 && max_len >= 110) {  // a few long names
                while (n.size() < 60 + rng.below(50)) n += std::string("_") + roots[rng.below(nr)];
            }
            if (n.size() >= 120) n.resize(120);
            if (n.back() == '_') n += 'x';
            std::string styled = style(n, rng);
            std::string u = upper(styled);
            if (styled.size() < min_len || styled.size() > max_len) continue;
            if (reserved_codes().count(u) || is_hash_word(u) || !seen.insert(u).second) continue;
            names_.push_back(styled);
        }
        weigh();
    }

    // Names given as they are (the short-name mix builds its own).
    explicit Vocabulary(std::vector<std::string> names) : names_(std::move(names)) { weigh(); }

    // A name drawn by rank r with weight 1/(r+4): the first few take a few
    // percent of all uses each, most are rare.
    const std::string &draw(Rng &rng) {
        double u = static_cast<double>(rng.next() >> 11) / 9007199254740992.0 * cumulative_.back();
        size_t i =
            std::lower_bound(cumulative_.begin(), cumulative_.end(), u) - cumulative_.begin();
        return names_[std::min(i, names_.size() - 1)];
    }

    const std::vector<std::string> &names() const { return names_; }

private:
    void weigh() {
        double total = 0;
        for (size_t i = 0; i < names_.size(); i++) {
            total += 1.0 / static_cast<double>(i + 4);
            cumulative_.push_back(total);
        }
    }

    static std::string style(const std::string &snake, Rng &rng) {
        unsigned s = rng.below(100);
        if (s < 60) return snake;
        if (s < 75) return upper(snake);
        std::string camel;  // CamelCase, first letter upper
        bool up = true;
        for (char c : snake) {
            if (c == '_') {
                up = true;
                continue;
            }
            camel += (up && c >= 'a' && c <= 'z') ? static_cast<char>(c - 32) : c;
            up = false;
        }
        return camel;
    }

    std::vector<std::string> names_;
    std::vector<double> cumulative_;
};

// ---------------------------------------------------------------------------
// Text for comments and literals.

const std::vector<std::string> &prose_words() {
    static const std::vector<std::string> w = {"the",
                                               "link",
                                               "is",
                                               "released",
                                               "when",
                                               "timer",
                                               "expires",
                                               "and",
                                               "no",
                                               "answer",
                                               "was",
                                               "received",
                                               "from",
                                               "peer",
                                               "entity",
                                               "a",
                                               "frame",
                                               "with",
                                               "bad",
                                               "check",
                                               "sum",
                                               "drops",
                                               "silently",
                                               "see",
                                               "section",
                                               "clause",
                                               "note",
                                               "value",
                                               "must",
                                               "not",
                                               "exceed",
                                               "window",
                                               "size",
                                               "octets",
                                               "are",
                                               "sent",
                                               "first",
                                               "high",
                                               "bit",
                                               "order",
                                               "state",
                                               "machine",
                                               "for",
                                               "call",
                                               "control",
                                               "of",
                                               "layer",
                                               "three",
                                               "retry",
                                               "count",
                                               "reset",
                                               "on",
                                               "restart",
                                               "define",
                                               "include",
                                               "ifdef",
                                               "endif",
                                               "TODO:",
                                               "FIXME",
                                               "(see",
                                               "above)",
                                               "e.g.",
                                               "i.e.",
                                               "->",
                                               "=>",
                                               "<tag>",
                                               "#1",
                                               "100%",
                                               "x<y",
                                               "a>b",
                                               "it's",
                                               "\"quoted\"",
                                               "caf\xc3\xa9",
                                               "na\xc3\xafve",
                                               "25\xc2\xb0"
                                               "C",
                                               "\xe2\x86\x92",
                                               "ok,",
                                               "done.",
                                               "n/a"};
    return w;
}

// Prose for comments: no "*" and no "/", so no comment bracket can form.
std::string comment_text(Rng &rng, int words) {
    std::string s;
    for (int i = 0; i < words; i++) {
        const std::string &w = rng.pick(prose_words());
        if (w.find('/') != std::string::npos) continue;
        if (!s.empty()) s += ' ';
        s += w;
    }
    return s;
}

// Text for literals: "/" only inside "n/a", never "*"; may hold quotes and,
// when lines are allowed, line feeds.
std::string literal_text(Rng &rng, size_t length, bool lines) {
    std::string s;
    size_t line_len = 0;
    while (s.size() < length) {
        if (lines && line_len > 40 && rng.percent(15)) {
            s += '\n';
            line_len = 0;
            continue;
        }
        std::string w;
        unsigned r = rng.below(100);
        if (r < 80)
            w = rng.pick(prose_words());
        else if (r < 88)
            w = std::to_string(rng.below(10000));
        else if (r < 92)
            w = "\"";
        else if (r < 94)
            w = "'";
        else if (r < 96)
            w = "\t";
        else
            w = std::string(1, "<>#%&|^~!?@$[](){}=+-.,;:"[rng.below(25)]);
        if (!s.empty() && s.back() != '\n') s += ' ';
        s += w;
        line_len += w.size() + 1;
    }
    if (s.size() > 2400) s.resize(2400);
    while (!s.empty() && (s.back() == '/' || s.back() == '*')) s.pop_back();
    return s;
}

// A reserved word's case, drawn once out of 100: below lower all lower case,
// below capital capitalised, below mixed each letter at random, else as given.
std::string vary_case(std::string s, Rng &rng, unsigned lower, unsigned capital, unsigned mixed) {
    const unsigned r = rng.below(100);
    if (r < lower) {
        for (char &c : s) c = static_cast<char>(c | 0x20);
    } else if (r < capital) {
        for (size_t i = 1; i < s.size(); i++) s[i] = static_cast<char>(s[i] | 0x20);
    } else if (r < mixed) {
        for (char &c : s)
            if (rng.percent(50)) c = static_cast<char>(c | 0x20);
    }
    return s;
}

// n hex digits, their letters in lower or in upper case.
std::string hex_digits(Rng &rng, bool lower, int n) {
    std::string digits;
    for (int i = 0; i < n; i++) {
        char c = "0123456789ABCDEF"[rng.below(16)];
        digits += lower && c > '9' ? static_cast<char>(c | 0x20) : c;
    }
    return digits;
}

// ---------------------------------------------------------------------------
// Directive material: names defined with and without bodies.

struct Macro {
    std::string name;
    std::string body_source;  // as written after the name
    std::vector<Token> body;  // what its expansion yields
};

struct DirectiveSet {
    std::vector<Macro> macros;
    std::vector<std::string> defined_flags;    // #define NAME (kind 25)
    std::vector<std::string> undefined_flags;  // never defined (kind 10)
    std::vector<std::string> include_names;    // file names, by index
    std::vector<std::vector<Token>> include_tokens;
    std::vector<uint64_t> include_bytes;  // bytes read when included, nested ones counted
};

// ---------------------------------------------------------------------------
// The language: units, statements, expressions.

class Generator {
public:
    Generator(Writer &w, Rng &rng, Vocabulary &vocab, const DirectiveSet *dir, int max_include)
        : w_(w), rng_(rng), vocab_(vocab), dir_(dir), max_include_(max_include) {}

    uint64_t extra_bytes() const { return extra_bytes_; }

    // Top-level units until the text reaches `target` bytes.
    void units(uint64_t target) {
        while (w_.text_bytes() < target) {
            unit_comment();
            unsigned r = rng_.below(100);
            if (dir_ && rng_.percent(10)) include_line();
            if (r < 45)
                system_unit();
            else if (r < 85)
                protocol_unit();
            else
                process_unit(0);
            w_.newline();
        }
    }

private:
    // -- lexical helpers --------------------------------------------------

    // A reserved word written in upper, lower, capitalised or mixed case.
    void kw(const char *word) {
        reserved_code(word);
        w_.word(vary_case(word, rng_, 15, 22, 25));
    }

    void id() {
        const std::string &n = vocab_.draw(rng_);
        if (rng_.percent(4))
            w_.word(upper(n));
        else
            w_.word(n);
    }

    void number(bool allow_negative) {
        unsigned r = rng_.below(1000);
        bool negative = allow_negative && rng_.percent(12);
        std::string digits;
        if (r < 550) {
            digits = std::to_string(rng_.below(100));
        } else if (r < 700) {
            digits = std::to_string(100 + rng_.below(65436));
        } else if (r < 750) {
            digits = std::to_string(rng_.next() & 0xFFFFFFFFu);
        } else if (r < 770) {
            int n = rng_.range(11, 40);
            digits = std::to_string(1 + rng_.below(9));
            while (static_cast<int>(digits.size()) < n)
                digits += static_cast<char>('0' + rng_.below(10));
        } else if (r < 910) {
            bool lower = rng_.percent(50);
            digits = hex_digits(rng_, lower, r < 900 ? rng_.range(1, 8) : rng_.range(9, 24));
            w_.number(rng_.percent(85) ? "0x" : "0X", digits, 16, negative);
            return;
        } else {
            int n = r < 990 ? rng_.range(1, 16) : rng_.range(17, 48);
            for (int i = 0; i < n; i++) digits += static_cast<char>('0' + rng_.below(2));
            w_.number(rng_.percent(85) ? "0b" : "0B", digits, 2, negative);
            return;
        }
        w_.number("", digits, 10, negative);
    }

    void string_lit() {
        unsigned r = rng_.below(1000);
        size_t len = r < 700   ? rng_.range(0, 24)
                     : r < 950 ? rng_.range(25, 120)
                     : r < 995 ? rng_.range(120, 400)
                               : rng_.range(400, 2300);
        w_.string_lit(literal_text(rng_, len, r >= 900), false);
    }

    void pdf_lit() { w_.string_lit(literal_text(rng_, rng_.range(0, 60), rng_.percent(5)), true); }

    void char_lit() {
        char c = rng_.percent(70) ? static_cast<char>('a' + rng_.below(26))
                                  : static_cast<char>(32 + rng_.below(95));
        w_.char_lit(c);
    }

    void maybe_line_comment() {
        unsigned r = rng_.below(100);
        if (r < 18) {
            w_.blank();
            w_.raw("// " + comment_text(rng_, rng_.range(1, 10)));
        } else if (r < 22) {
            w_.blank();
            w_.raw("/* " + comment_text(rng_, rng_.range(1, 8)) + " */");
        }
    }

    void end_line() {
        maybe_line_comment();
        w_.newline();
    }

    void semi() {
        w_.op(";");
        end_line();
    }

    void unit_comment() {
        unsigned r = rng_.below(100);
        if (r < 30) {
            w_.raw("/*\n");
            int n = rng_.range(1, 6);
            for (int i = 0; i < n; i++)
                w_.raw(" * " + comment_text(rng_, rng_.range(3, 14)) + "\n");
            w_.raw(" */\n");
        } else if (r < 40) {
            std::string stars(static_cast<size_t>(rng_.range(10, 70)), '*');
            w_.raw("/" + stars + "\n   " + comment_text(rng_, rng_.range(3, 10)) + "\n" + stars +
                   "/\n");
        } else if (r < 70) {
            int n = rng_.range(1, 3);
            for (int i = 0; i < n; i++)
                w_.raw("// " + comment_text(rng_, rng_.range(2, 12)) + "\n");
        }
        if (rng_.percent(30)) w_.newline();
        w_.set_tab_indent(rng_.percent(20));
    }

    // -- directives (directive variant only) -------------------------------

    // A use of a name defined with a body: its body is read in its place.
    bool macro_use() {
        if (!dir_ || dir_->macros.empty() || !rng_.percent(9)) return false;
        const Macro &m = dir_->macros[rng_.below(static_cast<uint32_t>(dir_->macros.size()))];
        w_.token_text(m.name, false);
        w_.replay(m.body);
        return true;
    }

    void include_line() {
        if (max_include_ <= 0) return;
        size_t first = dir_->include_names.size() - static_cast<size_t>(max_include_);
        size_t i = first + rng_.below(static_cast<uint32_t>(max_include_));
        w_.newline();
        w_.raw("#include \"" + dir_->include_names[i] + "\"\n");
        if (w_.live()) {
            w_.replay(dir_->include_tokens[i]);
            extra_bytes_ += dir_->include_bytes[i];
        }
    }

    // Opens a conditional region; returns the liveness to restore at its end.
    bool open_region() {
        bool outer = w_.live();
        bool ifdef = rng_.percent(60);
        bool defined = rng_.percent(65);
        const std::vector<std::string> &names =
            defined ? dir_->defined_flags : dir_->undefined_flags;
        const std::string &name = rng_.pick(names);
        w_.raw(std::string(ifdef ? "#ifdef " : "#ifndef ") + name + "\n");
        w_.set_live(outer && (ifdef == defined));
        return outer;
    }

    void close_region(bool outer) {
        w_.raw(rng_.percent(30) ? "#endif // region\n" : "#endif\n");
        w_.set_live(outer);
    }

    bool region_here(int nesting) { return dir_ && nesting < 4 && rng_.percent(12); }

    // -- expressions --------------------------------------------------------

    void primary(int depth) {
        if (macro_use()) return;
        if (dir_ && rng_.percent(1)) {  // a name defined without a body
            w_.hash_definition(rng_.pick(dir_->defined_flags));
            return;
        }
        unsigned r = rng_.below(100);
        if (r < 42) {
            id();
        } else if (r < 66) {
            number(true);
        } else if (r < 69) {
            string_lit();
        } else if (r < 72) {
            char_lit();
        } else if (r < 73) {
            pdf_lit();
        } else if (r < 78) {
            static const char *const atoms[] = {"TRUE",    "FALSE",   "NOW",       "SELF",
                                                "SENDER",  "PARENT",  "OFFSPRING", "VALID",
                                                "INVALID", "UNKNOWN", "UNDEFINED", "ACTIVE"};
            kw(atoms[rng_.below(12)]);
        } else if (r < 83) {
            id();
            bool tight = rng_.percent(70);
            w_.op(".", tight);
            if (tight) w_.glue_next();
            id();
        } else if (r < 87 && depth < 3) {
            id();
            w_.op("[", true);
            expr(depth + 1);
            w_.op("]");
        } else if (r < 92 && depth < 3) {
            call_args(depth + 1);
        } else if (r < 96 && depth < 3) {
            w_.op("(");
            expr(depth + 1);
            w_.op(")");
        } else {
            static const char *const unary[] = {"~", "!", "-"};
            if (rng_.percent(30)) {
                kw("NOT");
            } else {
                w_.op(unary[rng_.below(3)]);
            }
            if (depth < 3) {
                primary(depth + 1);
            } else {
                id();
            }
        }
    }

    void call_args(int depth) {
        id();
        w_.op("(", true);
        int n = rng_.range(0, 3);
        for (int i = 0; i < n; i++) {
            if (i > 0) w_.op(",");
            expr(depth);
        }
        w_.op(")");
    }

    void expr(int depth) {
        static const char *const binary[] = {
            "+", "-", "*", "/",  "%",  "=",  "/=", "!=", "<", ">", "<=", ">=", "<<", ">>",
            "&", "|", "^", "&&", "||", "^^", "..", "+",  "-", "=", "<",  ">",  "*",  "&&"};
        primary(depth);
        int n = depth >= 3 ? 0 : (rng_.percent(55) ? 0 : rng_.range(1, 3));
        for (int i = 0; i < n; i++) {
            if (rng_.percent(8)) {
                static const char *const words[] = {"AND", "OR", "XOR", "IN"};
                kw(words[rng_.below(4)]);
            } else {
                w_.op(binary[rng_.below(28)]);
            }
            primary(depth + 1);
        }
    }

    void type_name() {
        static const char *const types[] = {"INT",      "UINT",      "BYTE",       "UBYTE", "BIT",
                                            "NIBBLE",   "BOOL",      "CHARSTRING", "PID",   "TIME",
                                            "DURATION", "TIMESTAMP", "UINT",       "INT",   "BYTE"};
        if (macro_use()) return;
        if (rng_.percent(80))
            kw(types[rng_.below(15)]);
        else
            id();
    }

    // -- statements ---------------------------------------------------------

    void dcl(int level) {
        w_.indent(level);
        kw("DCL");
        int n = rng_.range(1, 4);
        for (int i = 0; i < n; i++) {
            if (i > 0) w_.op(",");
            id();
            type_name();
            if (rng_.percent(50)) {
                w_.op(":");
                w_.op("=", true);
                expr(0);
            }
        }
        semi();
    }

    void action(int level, int depth) {
        if (region_here(depth)) {
            w_.indent(0);
            bool outer = open_region();
            int n = rng_.range(1, 4);
            for (int i = 0; i < n; i++) action(level, depth + 1);
            close_region(outer);
            return;
        }
        w_.indent(level);
        unsigned r = rng_.below(100);
        if (r < 22) {
            kw("TASK");
            id();
            w_.op(":");
            w_.op("=", true);
            expr(0);
            semi();
        } else if (r < 40) {
            kw("OUTPUT");
            call_args(1);
            if (rng_.percent(40)) {
                kw("TO");
                if (rng_.percent(50)) {
                    static const char *const dests[] = {"SENDER", "PARENT", "OFFSPRING", "SELF",
                                                        "ENV"};
                    kw(dests[rng_.below(5)]);
                } else {
                    id();
                }
            }
            if (rng_.percent(20)) {
                kw("VIA");
                id();
            }
            semi();
        } else if (r < 48) {
            kw(rng_.percent(60) ? "SET" : "RESET");
            w_.op("(");
            if (rng_.percent(50)) {
                kw("NOW");
                w_.op("+");
                number(false);
                w_.op(",");
            }
            id();
            w_.op(")");
            semi();
        } else if (r < 58 && depth < 3) {
            kw("DECISION");
            expr(0);
            semi();
            int n = rng_.range(1, 3);
            for (int i = 0; i < n; i++) {
                w_.indent(level);
                w_.op("(");
                expr(1);
                w_.op(")");
                w_.op(":");
                w_.newline();
                int m = rng_.range(1, 3);
                for (int j = 0; j < m; j++) action(level + 1, depth + 1);
            }
            if (rng_.percent(60)) {
                w_.indent(level);
                kw("ELSE");
                w_.op(":");
                w_.newline();
                action(level + 1, depth + 1);
            }
            w_.indent(level);
            kw("ENDDECISION");
            semi();
        } else if (r < 66) {
            kw("LOG");
            w_.op("(", true);
            string_lit();
            int n = rng_.range(0, 3);
            for (int i = 0; i < n; i++) {
                w_.op(",");
                expr(1);
            }
            w_.op(")");
            semi();
        } else if (r < 72) {
            static const char *const words[] = {"JOIN",    "LINK", "UNLINK", "USE",        "STREAM",
                                                "CONTROL", "PC",   "DASS",   "CALLTRACEID"};
            kw(words[rng_.below(9)]);
            id();
            if (rng_.percent(50)) {
                kw(rng_.percent(50) ? "WITH" : "ON");
                expr(1);
            }
            semi();
        } else if (r < 76) {
            kw(rng_.percent(50) ? "INMSG" : "OUTMSG");
            id();
            w_.op("{");
            int n = rng_.range(1, 4);
            for (int i = 0; i < n; i++) {
                if (i > 0) w_.op(",");
                id();
                w_.op(":");
                w_.op("=", true);
                expr(1);
            }
            w_.op("}");
            semi();
        } else if (r < 82) {
            static const char *const words[] = {"EVENTTYPE",     "EVENTSTATUS", "RECORDNUMBER",
                                                "PREVIOUSINSEQ", "SELECTCODE",  "PROCESSKEY",
                                                "TIMESTAMP",     "DURATION",    "TIME"};
            kw(words[rng_.below(9)]);
            id();
            w_.op(":");
            w_.op("=", true);
            expr(1);
            semi();
        } else {
            id();
            w_.op(":");
            w_.op("=", true);
            expr(0);
            semi();
        }
    }

    void process_unit(int level) {
        w_.indent(level);
        kw("PROCESS");
        id();
        if (rng_.percent(40)) {
            w_.op("(");
            number(false);
            w_.op(",");
            number(false);
            w_.op(")");
        }
        if (rng_.percent(20)) kw(rng_.percent(50) ? "NOCREATE" : "REFERENCED");
        semi();
        int n = rng_.range(1, 3);
        for (int i = 0; i < n; i++) dcl(level + 1);
        if (rng_.percent(50)) {
            w_.indent(level + 1);
            kw("TIMER");
            id();
            semi();
        }
        w_.indent(level + 1);
        kw("START");
        semi();
        int m = rng_.range(1, 3);
        for (int i = 0; i < m; i++) action(level + 2, 0);
        w_.indent(level + 2);
        kw("NEXTSTATE");
        id();
        semi();
        int states = rng_.range(1, 4);
        for (int s = 0; s < states; s++) {
            w_.newline();
            w_.indent(level + 1);
            kw("STATE");
            id();
            if (rng_.percent(15)) {
                w_.op(",");
                id();
            }
            semi();
            int inputs = rng_.range(1, 3);
            for (int i = 0; i < inputs; i++) {
                w_.indent(level + 2);
                kw("INPUT");
                if (rng_.percent(70))
                    call_args(1);
                else
                    id();
                semi();
                int k = rng_.range(1, 5);
                for (int j = 0; j < k; j++) action(level + 3, 0);
                w_.indent(level + 3);
                if (rng_.percent(85)) {
                    kw("NEXTSTATE");
                    id();
                } else {
                    kw("STOP");
                }
                semi();
            }
            w_.indent(level + 1);
            kw("ENDSTATE");
            semi();
        }
        w_.indent(level);
        kw("ENDPROCESS");
        if (rng_.percent(50)) id();
        semi();
    }

    void signal_decl(int level) {
        w_.indent(level);
        kw("SIGNAL");
        int n = rng_.range(1, 4);
        for (int i = 0; i < n; i++) {
            if (i > 0) w_.op(",");
            id();
            if (rng_.percent(50)) {
                w_.op("(", true);
                int k = rng_.range(1, 3);
                for (int j = 0; j < k; j++) {
                    if (j > 0) w_.op(",");
                    type_name();
                }
                w_.op(")");
            }
        }
        semi();
    }

    void system_unit() {
        kw("SYSTEM");
        id();
        semi();
        int sig = rng_.range(1, 3);
        for (int i = 0; i < sig; i++) signal_decl(1);
        int blocks = rng_.range(1, 2);
        for (int b = 0; b < blocks; b++) {
            w_.indent(1);
            kw("BLOCK");
            id();
            semi();
            w_.indent(2);
            kw("SIGNALROUTE");
            id();
            kw("FROM");
            if (rng_.percent(40))
                kw("ENV");
            else
                id();
            kw("TO");
            id();
            kw("WITH");
            id();
            w_.op(",");
            id();
            semi();
            w_.indent(2);
            kw("CONNECT");
            id();
            kw("AND");
            id();
            semi();
            int procs = rng_.range(1, 2);
            for (int p = 0; p < procs; p++) {
                if (region_here(0)) {
                    bool outer = open_region();
                    process_unit(2);
                    close_region(outer);
                } else {
                    process_unit(2);
                }
            }
            w_.indent(1);
            kw("ENDBLOCK");
            semi();
        }
        if (rng_.percent(40)) {
            w_.indent(1);
            kw("CHANNELROUTE");
            id();
            kw("FROM");
            id();
            kw("TO");
            id();
            semi();
            w_.indent(1);
            kw("ENDCHANNELROUTE");
            semi();
        }
        kw("ENDSYSTEM");
        if (rng_.percent(60)) id();
        semi();
    }

    void field(int level) {
        w_.indent(level);
        kw("FIELD");
        id();
        type_name();
        if (rng_.percent(60)) {
            kw("POSITION");
            number(false);
        }
        if (rng_.percent(50)) {
            kw("LENGTH");
            number(false);
        }
        if (rng_.percent(30)) {
            kw("MASK");
            number(false);
        }
        if (rng_.percent(50)) {
            kw("VALUE");
            unsigned r = rng_.below(100);
            if (r < 15)
                string_lit();
            else if (r < 22)
                pdf_lit();
            else if (r < 30) {
                w_.op("[");
                number(true);
                w_.op("..");
                number(true);
                w_.op("]");
            } else
                expr(0);
        }
        if (rng_.percent(10)) kw(rng_.percent(50) ? "PROTECT" : "CRC");
        semi();
    }

    void protocol_unit() {
        kw("PROTOCOL");
        id();
        semi();
        if (rng_.percent(50)) {
            w_.indent(1);
            kw("TYPE");
            id();
            w_.op("=");
            type_name();
            w_.op("[");
            number(true);
            w_.op("..");
            number(true);
            w_.op("]");
            semi();
        }
        if (rng_.percent(30)) {
            w_.indent(1);
            kw(rng_.percent(50) ? "WINDOW" : "SEQUENCEVALIDITY");
            number(false);
            semi();
        }
        int templates = rng_.range(1, 3);
        for (int t = 0; t < templates; t++) {
            bool region = region_here(0);
            bool outer = false;
            if (region) outer = open_region();
            w_.indent(1);
            kw("TEMPLATE");
            id();
            kw("MESSAGE");
            id();
            if (rng_.percent(20)) {
                kw(rng_.percent(50) ? "STATIC" : "DYNAMIC");
            }
            semi();
            if (rng_.percent(40)) {
                w_.indent(2);
                kw("HEADER");
                w_.op("{");
                int n = rng_.range(1, 5);
                for (int i = 0; i < n; i++) {
                    if (i > 0) w_.op(",");
                    id();
                }
                w_.op("}");
                semi();
            }
            int fields = rng_.range(2, 9);
            for (int f = 0; f < fields; f++) {
                if (region_here(1)) {
                    bool o = open_region();
                    field(2);
                    close_region(o);
                } else {
                    field(2);
                }
            }
            w_.indent(2);
            kw("MATCH");
            expr(0);
            semi();
            if (rng_.percent(60)) {
                w_.indent(2);
                kw("GENERATE");
                id();
                w_.op("{");
                w_.newline();
                int n = rng_.range(1, 5);
                for (int i = 0; i < n; i++) {
                    w_.indent(3);
                    id();
                    w_.op(":");
                    w_.op("=", true);
                    unsigned r = rng_.below(100);
                    if (r < 20)
                        pdf_lit();
                    else if (r < 35)
                        char_lit();
                    else
                        expr(1);
                    if (i + 1 < n) w_.op(",");
                    end_line();
                }
                w_.indent(2);
                w_.op("}");
                semi();
            }
            if (rng_.percent(25)) {
                w_.indent(2);
                static const char *const dates[] = {"JAN", "FEB", "MAR", "APR", "MAY", "JUN",
                                                    "JUL", "AUG", "SEP", "OCT", "NOV", "DEC"};
                kw("TIMESTAMP");
                kw(dates[rng_.below(12)]);
                number(false);
                w_.op("..");
                kw(dates[rng_.below(12)]);
                number(false);
                semi();
            }
            if (rng_.percent(15)) {
                w_.indent(2);
                static const char *const words[] = {"STANDARD", "USERINTERFACE", "SOURCE",
                                                    "ALL",      "BOOL",          "STATE"};
                kw(words[rng_.below(6)]);
                id();
                semi();
            }
            if (region) close_region(outer);
        }
        if (rng_.percent(30)) process_unit(1);
    }

    Writer &w_;
    Rng &rng_;
    Vocabulary &vocab_;
    const DirectiveSet *dir_;
    int max_include_;  // the last max_include_ include files may be included here
    uint64_t extra_bytes_ = 0;
};

// ---------------------------------------------------------------------------
// Token mixes: statement-shaped lines whose tokens are drawn by share rather
// than by the grammar, to stress one path of a scanner at a time. LF line
// ends, no directives, a comment now and then.

struct Mix {
    const char *name;
    // Shares of the tokens, in tenths of a percent (they add up to 1000).
    unsigned op, id, kw, num, str, pdf, chr;
    // Distinct identifiers and their lengths; short names are 1 to 3 letters
    // (and a digit), built apart.
    size_t names, min_len, max_len;
    bool short_names;
    // Numbers: percent decimal and hex (the rest binary), percent negative,
    // and percent of long ones (beyond 32 bits, so their value wraps).
    unsigned dec, hex, negative, long_num;
    unsigned indent;  // deepest indentation, in levels of 4 blanks
};

// dense:    the dense operator-heavy text of a state machine's actions, about
//           7 bytes a token: operators 44 %, identifiers 24 % (1,000 names of
//           9 characters on average), reserved words 21.5 %, numbers 9.3 %;
// dense5k:  the same with 5,000 distinct names, most of them rare;
// numbers:  tables of numbers in the three bases, half the tokens;
// short:    short names (1 to 3 characters) in dense expressions.
const Mix mixes[] = {
    {"dense", 395, 260, 233, 101, 7, 2, 2, 1000, 5, 12, false, 70, 20, 8, 1, 7},
    {"dense5k", 395, 260, 233, 101, 7, 2, 2, 5000, 5, 12, false, 70, 20, 8, 1, 7},
    {"numbers", 380, 70, 50, 496, 2, 1, 1, 300, 4, 14, false, 55, 30, 10, 3, 1},
    {"short", 470, 330, 120, 76, 2, 1, 1, 400, 1, 3, true, 75, 15, 8, 0, 2},
};

const Mix *find_mix(const std::string &name) {
    for (const Mix &m : mixes)
        if (name == m.name) return &m;
    return nullptr;
}

// Names of one to three characters: a letter, then letters or digits; the
// ones that are reserved words are left out.
std::vector<std::string> short_names(Rng &rng, size_t count) {
    static const char alnum[] = "abcdefghijklmnopqrstuvwxyz0123456789";
    std::vector<std::string> names;
    std::unordered_set<std::string> seen;
    while (names.size() < count) {
        std::string n(1, static_cast<char>('a' + rng.below(26)));
        int more = rng.percent(25) ? 0 : (rng.percent(60) ? 1 : 2);
        for (int i = 0; i < more; i++) n += alnum[rng.below(36)];
        if (rng.percent(30)) n = upper(n);
        std::string u = upper(n);
        if (reserved_codes().count(u) || !seen.insert(u).second) continue;
        names.push_back(n);
    }
    return names;
}

class MixGenerator {
public:
    MixGenerator(Writer &w, Rng &rng, const Mix &mix)
        : w_(w),
          rng_(rng),
          mix_(mix),
          vocab_(mix.short_names ? Vocabulary(short_names(rng, mix.names))
                                 : Vocabulary(rng, mix.names, mix.min_len, mix.max_len)) {}

    void units(uint64_t target) {
        while (w_.text_bytes() < target) line();
    }

private:
    // One statement: an indentation, a run of tokens, ";" and a line feed.
    void line() {
        w_.indent(rng_.range(static_cast<int>(mix_.indent / 3), static_cast<int>(mix_.indent)));
        int n = rng_.range(4, 16);
        for (int i = 0; i < n; i++) token();
        w_.op(";");
        if (rng_.permille(15)) {
            w_.blank();
            w_.raw("// " + comment_text(rng_, rng_.range(2, 8)));
        }
        w_.newline();
    }

    void token() {
        unsigned r = rng_.below(1000);
        if (r < mix_.op) return op();
        r -= mix_.op;
        if (r < mix_.id) return id();
        r -= mix_.id;
        if (r < mix_.kw) return kw();
        r -= mix_.kw;
        if (r < mix_.num) return number();
        r -= mix_.num;
        if (r < mix_.str) return w_.string_lit(literal_text(rng_, rng_.range(0, 20), false), false);
        r -= mix_.str;
        if (r < mix_.pdf) return w_.string_lit(literal_text(rng_, rng_.range(0, 20), false), true);
        w_.char_lit(
            static_cast<char>(rng_.percent(70) ? 'a' + rng_.below(26) : 32 + rng_.below(95)));
    }

    // Operators by how often actions use them; every one has a blank before
    // it except the closers, and a "(" or "[" takes the next token against it.
    void op() {
        static const char *const ops[] = {
            "(",  "(",  "(",  ")",  ")",  ")", ",", ",", ",", ",", ":", "=",  "=",  "=",  "+",
            "+",  "-",  "-",  ".",  ".",  "[", "]", "*", "/", "<", ">", "<=", ">=", "/=", "!=",
            "&&", "||", "..", "<<", ">>", "&", "|", "^", "%", "~", "!", "^^", "{",  "}"};
        const char *s = ops[rng_.below(sizeof ops / sizeof ops[0])];
        w_.op(s);
        if (s[1] == '\0' && (s[0] == '(' || s[0] == '[')) w_.glue_next();
    }

    void id() {
        const std::string &n = vocab_.draw(rng_);
        w_.word(rng_.percent(4) ? upper(n) : n);
    }

    // Reserved words an action uses most, 5.6 characters on average; upper,
    // lower or capitalised, 1 % in mixed case.
    void kw() {
        static const char *const words[] = {
            "DCL",         "TASK",       "OUTPUT",    "INPUT",       "STATE",  "NEXTSTATE",
            "TO",          "AND",        "OR",        "NOT",         "INT",    "UINT",
            "BYTE",        "FIELD",      "VALUE",     "DECISION",    "ELSE",   "SET",
            "RESET",       "TIMER",      "NOW",       "TRUE",        "FALSE",  "PROCESS",
            "SIGNAL",      "MESSAGE",    "TEMPLATE",  "POSITION",    "LENGTH", "SENDER",
            "VIA",         "WITH",       "FROM",      "IN",          "STOP",   "MATCH",
            "GENERATE",    "CHARSTRING", "ENDSTATE",  "ENDDECISION", "SELF",   "OFFSPRING",
            "BOOL",        "XOR",        "NEXTSTATE", "OUTPUT",      "START",  "ENDPROCESS",
            "SIGNALROUTE", "TIMESTAMP",  "DURATION"};
        const char *word = words[rng_.below(sizeof words / sizeof words[0])];
        w_.word(vary_case(word, rng_, 35, 59, 60));
    }

    void number() {
        bool negative = rng_.percent(mix_.negative);
        bool is_long = rng_.percent(mix_.long_num);
        unsigned r = rng_.below(100);
        std::string digits;
        if (r < mix_.dec) {
            if (is_long) {
                digits = std::to_string(1 + rng_.below(9));
                for (int i = rng_.range(10, 24); i > 0; i--)
                    digits += static_cast<char>('0' + rng_.below(10));
            } else {
                unsigned k = rng_.below(100);
                digits = std::to_string(k < 60   ? rng_.below(10)
                                        : k < 85 ? rng_.below(1000)
                                                 : rng_.below(1000000));
            }
            w_.number("", digits, 10, negative);
        } else if (r < mix_.dec + mix_.hex) {
            bool lower = rng_.percent(50);
            digits = hex_digits(rng_, lower, is_long ? rng_.range(9, 20) : rng_.range(1, 8));
            w_.number(rng_.percent(85) ? "0x" : "0X", digits, 16, negative);
        } else {
            int n = is_long ? rng_.range(33, 48) : rng_.range(1, 16);
            for (int i = 0; i < n; i++) digits += static_cast<char>('0' + rng_.below(2));
            w_.number(rng_.percent(85) ? "0b" : "0B", digits, 2, negative);
        }
    }

    Writer &w_;
    Rng &rng_;
    const Mix &mix_;
    Vocabulary vocab_;
};

// ---------------------------------------------------------------------------
// Directive variant: names, bodies and include files.

std::string macro_name(Rng &rng, const Vocabulary &vocab, std::unordered_set<std::string> &used) {
    static const char *const a[] = {"MAX",  "MIN",  "DEFAULT", "CFG",   "NUM",  "LEN",
                                    "SIZE", "BASE", "LIMIT",   "FIRST", "LAST", "INIT"};
    static const char *const b[] = {"LINKS", "RETRY", "TIMEOUT",  "FRAME",  "WINDOW", "OCTETS",
                                    "SLOTS", "PEERS", "CALLS",    "DIGITS", "TONES",  "CELLS",
                                    "MASK",  "TYPE",  "GREETING", "LEVEL",  "GAIN",   "RATE"};
    static std::unordered_set<std::string> vocab_upper;
    if (vocab_upper.empty())
        for (const std::string &n : vocab.names()) vocab_upper.insert(upper(n));
    for (;;) {
        std::string n = std::string(a[rng.below(12)]) + "_" + b[rng.below(18)];
        if (rng.percent(30)) n += "_" + std::to_string(rng.below(10));
        if (reserved_codes().count(n) || vocab_upper.count(n) || !used.insert(n).second) continue;
        return n;
    }
}

// A body whose tokens survive being stored as texts: non-negative decimal
// numbers, words, one-character operators after the first token, and a
// string only in front.
Macro make_macro_once(Rng &rng, Vocabulary &vocab, std::unordered_set<std::string> &used) {
    Macro m;
    m.name = macro_name(rng, vocab, used);
    auto add_word = [&](const std::string &written) {
        std::string u = upper(written);
        auto it = reserved_codes().find(u);
        if (it != reserved_codes().end())
            m.body.push_back(Token{kReserved, it->second, u});
        else
            m.body.push_back(Token{kIdentifier, 0, u});
        m.body_source += written + " ";
    };
    auto add_number = [&]() {
        uint32_t v = rng.percent(70) ? rng.below(256) : static_cast<uint32_t>(rng.next());
        std::string d = std::to_string(v);
        m.body.push_back(Token{kNumber, static_cast<int32_t>(v), d});
        m.body_source += d + " ";
    };
    auto add_op = [&](char c) {
        m.body.push_back(Token{kOperator, static_cast<unsigned char>(c), std::string()});
        m.body_source += std::string(1, c) + " ";
    };
    unsigned r = rng.below(100);
    if (r < 45) {
        add_number();
    } else if (r < 60) {
        static const char *const types[] = {"UINT", "Byte", "int", "CHARSTRING", "Timer"};
        add_word(types[rng.below(5)]);
    } else if (r < 70) {
        std::string s = literal_text(rng, rng.range(3, 30), false);
        s.erase(std::remove(s.begin(), s.end(), '"'), s.end());
        if (s.empty()) s = "none";  // "" would read as one doubled quote
        m.body.push_back(Token{kString, 0, s});
        m.body_source += "\"" + s + "\" ";
    } else if (r < 85) {  // never an operator first: it would carry no text of its own
        add_word(vocab.draw(rng));
        add_op("+-*%"[rng.below(4)]);
        add_op('(');
        add_number();
        add_op("+-*%"[rng.below(4)]);
        add_word(vocab.draw(rng));
        add_op(')');
    } else {
        add_word(vocab.draw(rng));
        int n = rng.range(1, 4);
        for (int i = 0; i < n; i++) {
            add_op(',');
            if (rng.percent(50))
                add_word(vocab.draw(rng));
            else
                add_number();
        }
    }
    return m;
}

Macro make_macro(Rng &rng, Vocabulary &vocab, std::unordered_set<std::string> &used) {
    for (;;) {
        Macro m = make_macro_once(rng, vocab, used);
        if (m.body_source.size() < 200) return m;  // a macro frame reads 254 characters
        used.erase(m.name);
    }
}

std::string dir_of(const std::string &path) {
    size_t slash = path.rfind('/');
    return slash == std::string::npos ? std::string() : path.substr(0, slash + 1);
}

std::string stem_of(const std::string &path) {
    size_t slash = path.rfind('/');
    std::string base = slash == std::string::npos ? path : path.substr(slash + 1);
    size_t dot = base.rfind('.');
    return dot == std::string::npos ? base : base.substr(0, dot);
}

FILE *open_out(const std::string &path) {
    FILE *f = std::fopen(path.c_str(), "wb");
    if (!f) {
        std::perror(path.c_str());
        std::exit(1);
    }
    return f;
}

// The header of the main file: every name that the corpus defines.
void write_defines(Writer &w, const DirectiveSet &dir, Rng &rng) {
    w.raw("// Configuration of the generated protocol stack.\n");
    for (const std::string &f : dir.defined_flags) w.raw("#define " + f + "\n");
    w.newline();
    for (const Macro &m : dir.macros) {
        if (rng.percent(20)) w.raw("// " + comment_text(rng, rng.range(2, 8)) + "\n");
        w.raw("#define " + m.name + (rng.percent(80) ? " " : "\t") + m.body_source + "\n");
    }
    w.newline();
}

struct Result {
    uint64_t bytes;
    uint64_t bytes_read;
    uint64_t tokens;
    uint64_t hash;
};

Result generate(const std::string &variant, uint64_t size, uint64_t seed, const std::string &out) {
    Rng rng(seed);
    Vocabulary vocab(rng);
    Sink sink(false);
    Result res{};
    if (const Mix *mix = find_mix(variant)) {
        FILE *f = open_out(out);
        {
            Writer w(f, false, &sink);
            MixGenerator g(w, rng, *mix);
            g.units(size);
            w.flush();
            res.bytes = res.bytes_read = w.bytes();
        }
        std::fclose(f);
    } else if (variant == "plain" || variant == "crlf") {
        FILE *f = open_out(out);
        {
            Writer w(f, variant == "crlf", &sink);
            Generator g(w, rng, vocab, nullptr, 0);
            g.units(size);
            w.flush();
            res.bytes = res.bytes_read = w.bytes();
        }
        std::fclose(f);
    } else {
        DirectiveSet dir;
        std::unordered_set<std::string> used;
        for (int i = 0; i < 96; i++) dir.macros.push_back(make_macro(rng, vocab, used));
        for (int i = 0; i < 24; i++) dir.defined_flags.push_back("FEATURE_" + std::to_string(i));
        for (int i = 0; i < 24; i++)
            dir.undefined_flags.push_back("NO_FEATURE_" + std::to_string(i));
        // Include files, the deepest first: files 4..7 include nothing,
        // files 0..3 may include 4..7; the main file includes 0..3.
        const int kIncludes = 8;
        std::string dir_path = dir_of(out), stem = stem_of(out);
        for (int i = 0; i < kIncludes; i++)
            dir.include_names.push_back(stem + "_inc" + std::to_string(i) + ".tpl");
        dir.include_tokens.resize(kIncludes);
        dir.include_bytes.resize(kIncludes);
        for (int i = kIncludes - 1; i >= 0; i--) {
            Sink inc_sink(true);
            FILE *f = open_out(dir_path + dir.include_names[i]);
            uint64_t own = 0, extra = 0;
            {
                Writer w(f, false, &inc_sink);
                // Includes visible to file i: none for 4..7, files 4..7 for 0..3.
                DirectiveSet view = dir;
                view.include_names.resize(i < 4 ? kIncludes : 0);
                view.include_tokens.resize(view.include_names.size());
                view.include_bytes.resize(view.include_names.size());
                Generator g(w, rng, vocab, &view, i < 4 ? 4 : 0);
                g.units(i < 4 ? 12 * 1024 : 6 * 1024);
                w.flush();
                own = w.bytes();
                extra = g.extra_bytes();
            }
            std::fclose(f);
            dir.include_tokens[i] = inc_sink.tokens();
            dir.include_bytes[i] = own + extra;
        }
        FILE *f = open_out(out);
        {
            Writer w(f, false, &sink);
            write_defines(w, dir, rng);
            DirectiveSet view = dir;
            view.include_names.resize(4);
            Generator g(w, rng, vocab, &view, 4);
            g.units(size);
            w.flush();
            res.bytes = w.bytes();
            res.bytes_read = res.bytes + g.extra_bytes();
        }
        std::fclose(f);
    }
    res.tokens = sink.count();
    res.hash = sink.hash();
    return res;
}

uint64_t parse_size(const char *s) {
    char *end = nullptr;
    double v = std::strtod(s, &end);
    if (end && (*end == 'K' || *end == 'k')) v *= 1024;
    if (end && (*end == 'M' || *end == 'm')) v *= 1024 * 1024;
    return static_cast<uint64_t>(v);
}

int usage() {
    std::fprintf(stderr,
                 "usage: corpus_gen --variant plain|crlf|directive|dense|dense5k|numbers|short "
                 "--size N[K|M] [--seed S] "
                 "--out FILE\n");
    return 2;
}

}  // namespace

int main(int argc, char **argv) {
    std::string variant = "plain", out;
    uint64_t size = 1 << 20, seed = 1;
    for (int i = 1; i + 1 < argc; i += 2) {
        std::string opt = argv[i];
        if (opt == "--variant")
            variant = argv[i + 1];
        else if (opt == "--size")
            size = parse_size(argv[i + 1]);
        else if (opt == "--seed")
            seed = std::strtoull(argv[i + 1], nullptr, 0);
        else if (opt == "--out")
            out = argv[i + 1];
        else
            return usage();
    }
    if (out.empty() || (variant != "plain" && variant != "crlf" && variant != "directive" &&
                        find_mix(variant) == nullptr))
        return usage();
    Result r = generate(variant, size, seed, out);
    std::printf("file=%s bytes=%" PRIu64 " bytes_read=%" PRIu64 " tokens=%" PRIu64
                " checksum=%016" PRIx64 "\n",
                out.c_str(), r.bytes, r.bytes_read, r.tokens, r.hash);
    return 0;
}
