// What the scanner model (scanner_model_test.cpp) does not generate: limits
// that need long inputs, #include, predefined names, back_token,
// parse_string and the positions left in the frames. One line per case:
// tokens in their short form (see lex_harness.h).
#include "scan/scanner.h"

#include <gtest/gtest.h>

#include <cstring>
#include <string>
#include <vector>

#include "base/token.h"
#include "dict/dictionary.h"
#include "lex_harness.h"
#include "scan/directives.h"
#include "services/declarations.h"
#include "services/string_arg.h"
#include "session/lifecycle.h"

using tplex::test::describe;
using tplex::test::err;
using tplex::test::lex;
using tplex::test::lex_with_defines;
using tplex::test::LexSession;
using tplex::test::Tokens;

namespace {

std::string rep(char c, std::size_t n) {
    return std::string(n, c);
}

// The dictionary entry of a name: "kind:code", "|" and the first definition
// text if it has one; "absent" when the name is not there.
std::string entry(std::string name) {
    if (tplex::dict_lookup(name.data()) != 1) return "absent";
    const token_record &t = tplex::current_token;
    std::string out = std::to_string(t.kind) + ":" + std::to_string(t.value);
    return t.has_definition ? out + "|" + t.def_text1 : out;
}

std::string entry_after(const std::string &text, const std::string &name) {
    LexSession s;
    if (s.open(text) != 1) return "open failed";
    LexSession::all();
    return entry(name);
}

// Lexes texts[0] as the main file, texts[1...] written beside it as f1.src,
// f2.src...; "@1" to "@9" in any text stand for those files' full paths.
Tokens lex_files(std::vector<std::string> texts) {
    LexSession s;
    for (std::string &t : texts) {
        for (char i = '1'; i <= '9'; ++i) {
            const std::string path = s.dir().path() + "/f" + i + ".src";
            for (std::size_t at; (at = t.find(std::string("@") + i)) != std::string::npos;)
                t.replace(at, 2, path);
        }
    }
    for (std::size_t i = 1; i < texts.size(); ++i)
        s.file("f" + std::to_string(i) + ".src", texts[i]);
    if (s.open(texts[0]) != 1) return {"open failed"};
    return LexSession::all_described();
}

TEST(ScannerLimits, LongTokensKeepTheirFirstCharacters) {
    const std::string digits = rep('0', 125) + "12345";  // 130 digits
    EXPECT_EQ(lex(digits + " x"), (Tokens{"n:12345:" + digits.substr(0, 128), "id:X", "eof"}));
    const std::string body = rep('a', 2000) + rep('b', 3200);  // a string across two pieces
    EXPECT_EQ(lex("\"" + body + "\" x"), (Tokens{"s:" + body.substr(0, 2499), "id:X", "eof"}));
}

TEST(ScannerLimits, TwentyNestedNamesAreExpandedAndNoMore) {
    // M1 -> M2 -> ... -> M20 -> 7: twenty bodies pending at once.
    std::string text;
    for (int i = 0; i <= 20; ++i)
        text += "#define M" + std::to_string(i) + " " +
                (i == 20 ? "7" : "M" + std::to_string(i + 1)) + "\n";
    EXPECT_EQ(lex(text + "M1 M20"), (Tokens{"n:7:7", "n:7:7", "eof"}));
    EXPECT_EQ(lex(text + "M0 z"), (Tokens{err(TPLEX_TOO_MANY_MACRO_LEVELS), "id:Z", "eof"}));
}

TEST(ScannerLimits, TwentyNestedRegionsAndNoMore) {
    std::string open20, close20;
    for (int i = 0; i < 20; ++i) open20 += "#ifndef N\n", close20 += "#endif\n";
    EXPECT_EQ(lex(open20 + "a\n" + close20 + "b"), (Tokens{"id:A", "id:B", "eof"}));
    EXPECT_EQ(
        lex(open20 + "#ifndef N\na\n" + close20 + "#endif\nb"),
        (Tokens{err(TPLEX_TOO_MANY_COND_LEVELS), "id:A", err(TPLEX_EXTRA_ENDIF), "id:B", "eof"}));
    LexSession s;
    ASSERT_EQ(s.open(open20 + "#ifdef N\na\n"), 1);
    EXPECT_EQ(LexSession::all_described(),
              (Tokens{err(TPLEX_TOO_MANY_COND_LEVELS), "id:A", "eof"}));
    EXPECT_EQ(tplex::cond_depth, 20);
}

TEST(ScannerLimits, DefineBodyLengths) {
    // "A " then 226 words of 10 with their blanks: 2488; a last word of 9
    // makes 2499 and is taken, one of 10 is refused.
    std::string line = "#define L a";
    for (int i = 0; i < 226; ++i) line += " " + rep('w', 10);
    EXPECT_EQ(entry_after(line + " " + rep('z', 9) + "\n", "L").size(), 4u + 2488 + 10);
    EXPECT_EQ(lex(line + " " + rep('z', 10) + "\n").front(), err(TPLEX_MACRO_TOO_LONG));
    EXPECT_EQ(entry_after(line + " " + rep('z', 10) + "\n", "L"), "absent");
    // Every token is measured as spelled, the first one too: a string in
    // quotes, a PDF string in its brackets, each quote inside doubled.
    EXPECT_EQ(entry_after("#define S \"" + rep('s', 2495) + "\"\n", "S"),
              "4:0|\"" + rep('s', 2495) + "\" ");
    EXPECT_EQ(lex("#define S \"" + rep('s', 2496) + "\"\nS"),
              (Tokens{err(TPLEX_MACRO_TOO_LONG), "id:S", "eof"}));
    EXPECT_EQ(entry_after("#define P <\"" + rep('p', 2493) + "\">\n", "P"),
              "4:0|<\"" + rep('p', 2493) + "\"> ");
    EXPECT_EQ(lex("#define P <\"" + rep('p', 2494) + "\">\nP"),
              (Tokens{err(TPLEX_MACRO_TOO_LONG), "id:P", "eof"}));
    EXPECT_EQ(entry_after("#define Q a \"" + rep('"', 2 * 1246) + "\"\n", "Q").size(),
              4u + 2 + 2494 + 1);
    EXPECT_EQ(lex("#define Q a \"" + rep('"', 2 * 1247) + "\"\n").front(),
              err(TPLEX_MACRO_TOO_LONG));
}

// A body read through its name gives the tokens it gives written in place.
TEST(DefineBody, ReadsBackAsWritten) {
    const std::string bodies[] = {
        "0x1F -0x10 0b101 -3 12 0 0X00ff 007 -0 4294967295 0b0",
        rep('7', 130) + " x",  // the value needs digits beyond the 128 kept
        "\"a\" \"say \"\"hi\"\"\" \"\" \"\"\"\"",
        "x \"two words\" \"/* c */ //\" \"a\nb\"",
        "<\"pdf\"> x <\"a\"\"b\"> <\"\">",
        "/= || && <= >= << >> .. ^^ !=",
        "% ( ) * + , : ; = [ ] { } ~ ! & - . / < > ^ | - 5",
        "protocol State x_1 abc",
        "'c' x",
        "'\"'",
        "<= 1",
    };
    for (const std::string &body : bodies)
        EXPECT_EQ(lex("#define N " + body + "\nN"), lex(body)) << body;
}

// Switched-off regions drop uses of defined names at no cost and without a
// report; a name that names itself stops after 20 bodies. Only a tree of
// names multiplying past 4 Mi tokens since the last character of a file is
// cut off with a report.
TEST(DefineBody, DroppedInSwitchedOffRegions) {
    std::string uses, self, tree = "#define P L1 y\n";  // each name before its use
    for (int i = 0; i < 100000; ++i) uses += "X\n";
    for (int i = 0; i < 2000; ++i) self += "a b a\n";
    for (int i = 1; i <= 11; ++i) {
        const std::string next = i == 11 ? " x" : " L" + std::to_string(i + 1);
        tree += "#define L" + std::to_string(i) + next + next + next + next + "\n";
    }
    EXPECT_EQ(lex("#define X 1 2 3\n#ifdef NO\n" + uses + "#endif\nz"), (Tokens{"id:Z", "eof"}));
    EXPECT_EQ(lex("#define A a a a\n#define B b b\n#ifdef NO\n" + self + "#endif\nz"),
              (Tokens{"id:Z", "eof"}));
    EXPECT_EQ(lex(tree + "#ifdef NO\nL1\nP\n#endif\nz"),
              (Tokens{err(TPLEX_TOO_MANY_MACRO_LEVELS), "id:Z", "eof"}));
}

TEST(Include, FilesAndTheLinesAroundThem) {
    // Nested files end into their includers' next lines; the rest of an
    // #include line is never read.
    EXPECT_EQ(
        lex_files({"a\n#include \"@1\" NOTREAD\nb", "m1\n#include \"@2\" $ \"\nm2\n", "i1\ni2"}),
        (Tokens{"id:A", "id:M1", "id:I1", "id:I2", "id:M2", "id:B", "eof"}));
    // A string and a word run on into the includer's next line.
    EXPECT_EQ(lex_files({"#include \"@1\"\nxyz\" q", "\"abc"}),
              (Tokens{"s:abcxyz", "id:Q", "eof"}));
    EXPECT_EQ(lex_files({"#include \"@1\"\ncd", "ab"}), (Tokens{"id:AB", "id:CD", "eof"}));
    // So does a #define on the last line: the next line becomes its body.
    EXPECT_EQ(lex_files({"#include \"@1\"\n#ifdef DEBUG\nx\n#endif\ny", "#define DEBUG"}),
              (Tokens{"id:X", err(TPLEX_EXTRA_ENDIF), "id:Y", "eof"}));
    // Definitions and regions carry across files.
    EXPECT_EQ(lex_files({"#include \"@1\"\nV\n#endif\nV", "#define V 42\n#ifdef NO\n"}),
              (Tokens{"n:42:42", "eof"}));
    EXPECT_EQ(lex_files({"#ifdef NO\n#include \"@1\"\n#endif\nb", "x\n"}), (Tokens{"id:B", "eof"}));
    // A name that fails to scan opens nothing; its failure is reported.
    EXPECT_EQ(lex_files({"#include $ x\nb"}),
              (Tokens{err(TPLEX_BAD_CHARACTER), "id:X", "id:B", "eof"}));
    EXPECT_EQ(lex_files({"#include \"unterminated"}),
              (Tokens{err(TPLEX_END_OF_LINE_IN_STRING), "eof"}));
    EXPECT_EQ(lex_files({"#include 0b102\nb"}), (Tokens{err(TPLEX_BAD_DIGIT), "id:B", "eof"}));
    const Tokens missing = lex_files({"#include \"@9\" x\nb"});
    ASSERT_EQ(missing.size(), 4u);
    EXPECT_EQ(missing[0].substr(0, 4), "err:");
    EXPECT_EQ(Tokens(missing.begin() + 1, missing.end()), (Tokens{"id:X", "id:B", "eof"}));
}

TEST(InitDefines, NamesAreDefinedInUpperCaseUntilAKnownOne) {
    EXPECT_EQ(lex_with_defines("#ifdef TRACE\na\n#endif\nb", {"trace"}),
              (Tokens{"id:A", "id:B", "eof"}));
    EXPECT_EQ(lex_with_defines("#define D 5\nD", {"d"}),
              (Tokens{err(TPLEX_MACRO_REDEFINED), "def:D:2", "eof"}));
    LexSession s;
    char a[] = "a", b[] = "Trace", again[] = "A", c[] = "c", p[] = "protocol";
    char *names[] = {a, b, again, c};
    EXPECT_EQ(sc_lex_init_defines(names, 0), 0);
    EXPECT_STREQ(a, "a");
    EXPECT_EQ(sc_lex_init_defines(names, 4), TPLEX_ALREADY_DEFINED);
    EXPECT_STREQ(b, "TRACE");
    EXPECT_EQ(entry("trace"), "25:2");
    EXPECT_EQ(entry("C"), "absent");
    char *keyword[] = {p};
    EXPECT_EQ(sc_lex_init_defines(keyword, 1), TPLEX_ALREADY_DEFINED);
    EXPECT_EQ(entry("PROTOCOL"), "9:0");
}

TEST(BackToken, TheSameRecordAgainButNoFailure) {
    LexSession s;
    ASSERT_EQ(s.open("abc 12 $ d"), 1);
    EXPECT_EQ(describe(LexSession::next()), "id:ABC");
    back_token();
    back_token();  // a second call changes nothing
    EXPECT_EQ(describe(LexSession::next()), "id:ABC");
    EXPECT_EQ(describe(LexSession::next()), "n:12:12");
    EXPECT_EQ(LexSession::next().result, TPLEX_BAD_CHARACTER);
    back_token();  // the record's kind comes back, not the failure
    EXPECT_EQ(describe(LexSession::next()), "n:12:12");
    EXPECT_EQ(LexSession::all_described(), (Tokens{"id:D", "eof"}));
    back_token();
    EXPECT_EQ(LexSession::all_described(), (Tokens{"eof"}));
}

TEST(Frames, ReadPositionAndLineAfterEachToken) {
    LexSession s;
    ASSERT_EQ(s.open("abc def\n" + rep('x', 4998) + "/*\nz\n"), 1);
    source_frame *frames = nullptr;
    sc_lex_setup(nullptr, &frames, nullptr, nullptr, nullptr);
    const std::vector<std::pair<std::string, int>> expected = {
        {"id:ABC", 3},   {"id:DEF", 7}, {"id:" + rep('X', 128), 4998},
        {"op:47", 4999}, {"op:42", 1},  {"id:Z", 1}};
    std::vector<unsigned> lines;
    for (const auto &[token, pos] : expected) {
        EXPECT_EQ(describe(LexSession::next()), token);
        EXPECT_EQ(frames[1].read_pos, pos) << token;
        lines.push_back(frames[1].line_no);
    }
    // A line longer than 4999 arrives in pieces, each counted as a line.
    EXPECT_EQ(lines, (std::vector<unsigned>{0, 0, 1, 1, 2, 3}));
}

// parse_string in a mode on a text: "result|output|the tokens after".
std::string parse(const std::string &text, std::uint8_t mode) {
    LexSession s;
    if (s.open(text) != 1) return "open failed";
    char out[2500] = "untouched";
    const status_code r = tplex::parse_string(out, mode);
    std::string rest;
    for (const std::string &t : LexSession::all_described()) rest += " " + t;
    return (r < 0 ? err(r) : std::to_string(r)) + "|" + out + "|" + rest;
}

TEST(ParseString, Modes) {
    const std::string not_allowed = err(TPLEX_STRING_NOT_ALLOWED),
                      expected = err(TPLEX_STRING_EXPECTED);
    EXPECT_EQ(parse("abc x", 1), "0|| id:ABC id:X eof");  // optional: anything else is given back
    EXPECT_EQ(parse("<\"p\"> x", 1), "0|| pdf:p id:X eof");
    EXPECT_EQ(parse("\"a b\" x", 1), "0|a b| id:X eof");
    EXPECT_EQ(parse("\"\" x", 1), "0|| id:X eof");
    EXPECT_EQ(parse("12 x", 0), "0|| n:12:12 id:X eof");  // not allowed
    EXPECT_EQ(parse("\"a\" x", 0), not_allowed + "|untouched| id:X eof");
    EXPECT_EQ(parse("\"a\" x", 2), "0|a| id:X eof");  // required: anything else is consumed
    EXPECT_EQ(parse("\"a\" x", 255), "0|a| id:X eof");
    EXPECT_EQ(parse("<\"p\"> x", 2), expected + "|untouched| id:X eof");
    EXPECT_EQ(parse("'c' x", 7), expected + "|untouched| id:X eof");
    EXPECT_EQ(parse("", 2), expected + "|untouched| eof");
    EXPECT_EQ(parse("12ab x", 1), err(TPLEX_BAD_DIGIT) + "|untouched| id:B id:X eof");
    EXPECT_EQ(parse("\"s", 2), err(TPLEX_END_OF_LINE_IN_STRING) + "|untouched| eof");
    EXPECT_EQ(parse("#define S \"def\"\n#ifdef NO\n\"skipped\"\n#endif\nS", 2), "0|def| eof");
    EXPECT_EQ(parse("\"" + rep('q', 2499) + "zz\"", 1), "0|" + rep('q', 2499) + "| eof");
}

}  // namespace
