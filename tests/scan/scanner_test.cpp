// The scanner and the directive filter through sc_next_token, tokens in their short form.
#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "test_support.h"

namespace tplex::test {
namespace {

const std::string bad = err(TPLEX_BAD_CHARACTER), bad_digit = err(TPLEX_BAD_DIGIT);

std::string repeat(const std::string &s, int n) {
    return n > 0 ? s + repeat(s, n - 1) : "";
}

using Cases = std::vector<std::pair<std::string, std::string>>;  // text, tokens

void expect_tokens(const Cases &cases) {
    for (const auto &[text, tokens] : cases) EXPECT_EQ(lex(text), tokens) << text;
}

TEST(Scanner, Tokens) {
    // clang-format off
    expect_tokens({
        {"abc Zq x_1 protocol State window", "id:ABC id:ZQ id:X_1 rw:0 rw:2 rw:117 eof"},
        {"0 7 007 12 0x1F 0X00ff 0b101 0B0",
         "n:0:0 n:7:7 n:7:007 n:12:12 n:31:1F n:255:00ff n:5:101 n:0:0 eof"},
        {"-3 - 3 -0x10 a-1 -0", "n:-3:3 op:45 n:3:3 n:-16:10 id:A n:-1:1 n:0:0 eof"},
        {"4294967295 4294967296", "n:-1:4294967295 n:0:4294967296 eof"},
        {"12ab 0b102 0x 9", bad_digit + " id:B " + bad_digit + " " + bad_digit + " n:9:9 eof"},
        {"% ( ) * + , : ; = [ ] { } ~ ! & - . / < > ^ | <=>",
         "op:37 op:40 op:41 op:42 op:43 op:44 op:58 op:59 op:61 op:91 op:93 op:123 op:125 op:126 "
         "op:33 op:38 op:45 op:46 op:47 op:60 op:62 op:94 op:124 op:5 op:62 eof"},
        {"/= || && <= >= << >> .. ^^ != ->",
         "op:2 op:3 op:4 op:5 op:6 op:7 op:8 op:9 op:10 op:11 op:45 op:62 eof"},
        {"\"a b\" \"say \"\"hi\"\"\" \"\" \"x\ny\" \"/* c */ //\"",
         "s:a b s:say \"hi\" s: s:x\ny s:\xfb c \xfc \xfd eof"},
        {"<\"p\"> <\"a\"\"b\"> <\"\"> <\"x\"y \"open", "pdf:p pdf:a\"b pdf: " +
         err(TPLEX_BAD_PDF_STRING) + " id:Y " + err(TPLEX_END_OF_LINE_IN_STRING) + " eof"},
        {"'c' '\"' ''' 'ab\n'", "ch:c ch:\" ch:' " + bad + " " +
         err(TPLEX_END_OF_LINE_IN_CHAR) + " eof"},
        {"a /* b */ c // d\ne /* x\ny */ f/**/g", "id:A id:C id:E id:F id:G eof"},
        {"a */ b / * c /* open", "id:A " + bad + " id:B op:47 op:42 id:C eof"},
        {"$ ? @ \\ ` _ \x7f \x80 \xfe \r", repeat(bad + " ", 10) + "eof"},
        // Marker bytes in the text: 251 opens a comment, 253 a line comment, 255 ends the input.
        {"a\xfb b */ c\xfd d\ne \xfc f\xff g", "id:A id:C id:E " + bad + " id:F eof"},
        {"#foo a # b", err(TPLEX_EXTRA_ENDIF) + " id:A " + err(TPLEX_EXTRA_ENDIF) + " id:B eof"},
        // Text mode: CR LF is LF, a lone CR a character, 0x1A the end, a NUL ends its line.
        {std::string("a\r\nb \"c\r\nd\"\r\ne\0f\ng\x1a h", 21), "id:A id:B s:c\nd id:E id:G eof"}});
    // clang-format on
}

TEST(Scanner, LongTokensKeepTheirFirstCharacters) {
    const std::string digits = std::string(125, '0') + "12345",
                      body = std::string(2000, 'a') + std::string(3200, 'b');
    expect_tokens({{digits + " x", "n:12345:" + digits.substr(0, 128) + " id:X eof"},
                   {std::string(130, 'w') + " x", "id:" + std::string(128, 'W') + " id:X eof"},
                   {"\"" + body + "\" x", "s:" + body.substr(0, 2499) + " id:X eof"}});
}

TEST(Directives, Regions) {
    const std::string extra = err(TPLEX_EXTRA_ENDIF), bad_word = err(TPLEX_BAD_HASH_WORD);
    const std::string open20 = repeat("#ifndef N\n", 20), close20 = repeat("#endif\n", 20);
    expect_tokens({{"#define F\n#ifdef F\na\n#endif\n#ifndef F\nb\n#endif\nc", "id:A id:C eof"},
                   {"#ifdef N\na\n#ifndef N\nb\n#endif\nc\n#endif\nd", "id:D eof"},
                   {"#define 5\n#ifdef 5\na\n#endif\nb", bad_word + " " + bad_word + " id:B eof"},
                   {"#define F\n#define F\na", err(TPLEX_UNEXPECTED_HASH_WORD) + " id:A eof"},
                   {"#ifdef N\n#define 5\n#endif\na", "id:A eof"},
                   {open20 + "a\n" + close20 + "b", "id:A id:B eof"},
                   {open20 + "#ifndef N\na\n" + close20 + "#endif\nb",
                    err(TPLEX_TOO_MANY_COND_LEVELS) + " id:A " + extra + " id:B eof"}});
}

TEST(Directives, Defines) {
    std::string chain;  // M1 -> M2 -> ... -> M20 -> M21: twenty bodies pending at once
    for (int i = 0; i <= 20; ++i)
        chain += "#define M" + std::to_string(i) + " M" + std::to_string(i + 1) + "\n";
    const std::string too_long = err(TPLEX_MACRO_TOO_LONG),
                      levels = err(TPLEX_TOO_MANY_MACRO_LEVELS);
    // clang-format off
    expect_tokens({
        {"#define F\n#define F 2\nF", err(TPLEX_MACRO_REDEFINED) + " def:F:0 eof"},
        {"#define X 1\n#define X 2\nX", err(TPLEX_BAD_HASH_WORD) + " n:2:2 n:1:1 eof"},  // expanded
        {"#define B 'c' x\nB", "ch:c id:X eof"},  // and each name its own body, every time:
        {"#define A 1\n#define B 2 3\nA B A B", repeat("n:1:1 n:2:2 n:3:3 ", 2) + "eof"},
        {"#define B x 'c'\nB", err(TPLEX_MACRO_BAD_TOKEN) + " id:B eof"},
        {"#define A x A\nA b", repeat("id:X ", 20) + levels + " id:B eof"},
        {chain + "M1 M20", "id:M21 id:M21 eof"}, {chain + "M0 z", levels + " id:Z eof"},
        {"#define S \"" + std::string(2496, 's') + "\"\nS", too_long + " id:S eof"},
        {"#define P <\"" + std::string(2494, 'p') + "\">\nP", too_long + " id:P eof"},
        // Switched off, uses of names (even self-naming ones) cost and report nothing.
        {"#define X 1 2 3\n#define A a A\n#ifdef NO\nX A\n#endif\nz", "id:Z eof"}});
    // clang-format on
}

// A body read through its name gives the tokens it gives written in place.
TEST(Directives, BodiesReadBackAsWritten) {
    for (const std::string &body : std::vector<std::string>{
             "0x1F -0x10 0b101 -3 12 0 0X00ff 007 -0 4294967295 0b0 x",
             std::string(130, '7') + " x",  // a value that needs digits beyond the 128 kept
             "\"a\" \"say \"\"hi\"\"\" \"\" \"\"\"\" \"/* c */ //\" \"a\nb\"",
             "/= || && <= >= << >> .. ^^ != % ( ) * + , : ; = [ ] { } ~ ! & - . / < > ^ | - 5",
             "'\"' <\"pdf\"> x <\"a\"\"b\"> <\"\"> protocol State x_1 abc",
             "\"" + std::string(1246, '"') + "\""})
        EXPECT_EQ(lex("#define N " + body + "\nN"), lex(body)) << body;
    // 2488 characters spelled, then a word of 9 fits, of 10 not.
    const std::string words = "a" + repeat(" wwwwwwwwww", 226);
    EXPECT_EQ(lex("#define L " + words + " zzzzzzzzz\nL"), lex(words + " zzzzzzzzz"));
    EXPECT_EQ(lex("#define L " + words + " zzzzzzzzzz\nL"),
              err(TPLEX_MACRO_TOO_LONG) + " id:L eof");
}

// texts[0] is the main file, texts[1...] f1.src, f2.src... beside it; "@1".."@9" their paths.
std::string lex_files(std::vector<std::string> texts) {
    LexSession s;
    for (std::string &t : texts)
        for (std::size_t at; (at = t.find('@')) != std::string::npos;)
            t.replace(at, 2, s.dir.path + "/f" + t[at + 1] + ".src");
    for (std::size_t i = 1; i < texts.size(); ++i)
        s.dir.write("f" + std::to_string(i) + ".src", texts[i]);
    return s.open(texts[0]) == 1 ? rest() : "open failed";
}

TEST(Directives, Include) {
    const std::vector<std::pair<std::vector<std::string>, std::string>> cases = {
        // Nested files end into their includers' next lines; an #include line's rest is not read.
        {{"a\n#include \"@1\" NOTREAD\nb", "m1\n#include \"@2\" $ \"\nm2\n", "i1\ni2"},
         "id:A id:M1 id:I1 id:I2 id:M2 id:B eof"},
        // A string, a word, a #define run on into the includer's next line.
        {{"#include \"@1\"\nxyz\" q", "\"abc"}, "s:abcxyz id:Q eof"},
        {{"#include \"@1\"\ncd", "ab"}, "id:AB id:CD eof"},
        {{"#include \"@1\"\n#ifdef DEBUG\nx\n#endif\ny", "#define DEBUG"},
         "id:X " + err(TPLEX_EXTRA_ENDIF) + " id:Y eof"},
        // Definitions and regions carry across files.
        {{"#include \"@1\"\nV\n#endif\nV", "#define V 42\n#ifdef NO\n"}, "n:42:42 eof"},
        {{"#ifdef NO\n#include \"@1\"\n#endif\nb", "x\n"}, "id:B eof"},
        // A name that fails to scan opens nothing; its failure is reported.
        {{"#include $ x\nb"}, bad + " id:X id:B eof"},
        {{"#include \"@9\" x\nb"}, err(TPLEX_CANNOT_OPEN_SOURCE) + " id:X id:B eof"}};
    for (const auto &[files, tokens] : cases) EXPECT_EQ(lex_files(files), tokens) << files[0];
}

// Names are defined in upper case (code 2) up to the first one already known.
TEST(InitDefines, NamesAreDefinedInUpperCaseUntilAKnownOne) {
    LexSession s;
    char a[] = "a", b[] = "Trace", known[] = "protocol", c[] = "c";
    char *names[] = {a, b, known, c};
    EXPECT_EQ(sc_lex_init_defines(names, 4), TPLEX_ALREADY_DEFINED);
    EXPECT_STREQ(b, "TRACE");
    EXPECT_EQ(s.open("trace c"), 1);
    EXPECT_EQ(rest(), "def:TRACE:2 id:C eof");
}

TEST(BackToken, TheSameRecordAgainButNoFailure) {
    LexSession s;
    ASSERT_EQ(s.open("abc $ d"), 1);
    EXPECT_EQ(next(), "id:ABC");
    back_token(), back_token();  // a second call changes nothing
    EXPECT_EQ(next(), "id:ABC");
    EXPECT_EQ(next(), bad);
    back_token();  // the record's kind comes back, not the failure
    EXPECT_EQ(rest(), "id:ABC id:D eof");
    back_token();
    EXPECT_EQ(rest(), "eof");
}

// Frame 1's read position and line after each token; a line over 4999 comes in pieces.
TEST(Frames, ReadPositionAndLineAfterEachToken) {
    LexSession s;
    ASSERT_EQ(s.open(repeat(std::string(4998, 'x') + "/*\n", 2)), 1);  // a first and a later line
    source_frame *frames = nullptr;
    sc_lex_setup(nullptr, &frames, nullptr, nullptr, nullptr);
    std::string seen;
    for (int i = 0; i < 6; ++i) {
        seen += next().substr(0, 5) + "@";
        seen += std::to_string(frames[1].line_no) + ":" + std::to_string(frames[1].read_pos) + " ";
    }
    EXPECT_EQ(seen, "id:XX@0:4998 op:47@0:4999 op:42@1:1 id:XX@2:4998 op:47@2:4999 op:42@3:1 ");
}

}  // namespace
}  // namespace tplex::test
