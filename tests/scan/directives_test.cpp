// Hash directives and conditional compilation through real files.
#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "dict/dictionary.h"
#include "lex/lexer.h"
#include "lex/memory.h"
#include "lex_harness.h"
#include "scan/directives.h"

using tplex::test::err;
using tplex::test::lex;
using tplex::test::lex_with_defines;
using tplex::test::LexSession;
using tplex::test::Token;
using tplex::test::Tokens;

namespace {

std::string rep(char c, std::size_t n) { return std::string(n, c); }

// The dictionary entry of a name: "kind:code" and, for an entry with a
// definition, "|" and its first text; "absent" when the name is not there.
std::string entry(std::string name) {
    if (tplex::dict_lookup(name.data()) != 1) return "absent";
    const token_record &t = tplex::current_token;
    std::string out = std::to_string(t.kind) + ":" + std::to_string(t.value);
    if (t.has_definition) out += "|" + std::string(t.def_text1);
    return out;
}

// Lexes a text to its end and then describes the entry of a name.
std::string entry_after(const std::string &text, const std::string &name) {
    LexSession s;
    if (s.open(text) != 1) return "open failed";
    LexSession::all();
    return entry(name);
}

// ---------------------------------------------------------------- #define

TEST(Define, WithoutABody) {
    EXPECT_EQ(lex("#define DEBUG\nDEBUG debug"), (Tokens{"def:DEBUG:0", "def:DEBUG:0", "eof"}));
    EXPECT_EQ(lex("define DEBUG\nDEBUG"), (Tokens{"def:DEBUG:0", "eof"}));
    EXPECT_EQ(entry_after("#define DEBUG\n", "DEBUG"), "25:0");
    EXPECT_EQ(entry_after("#define debug /* note */\n", "DEBUG"), "25:0");
    // A line comment swallows the end of line: the end of input that
    // follows starts a body, which takes the record's text (the name).
    EXPECT_EQ(entry_after("#define debug // note\n", "DEBUG"), "4:0|DEBUG ");
}

TEST(Define, WithABody) {
    EXPECT_EQ(lex("#define MAX 10\nMAX"), (Tokens{"n:10:10", "eof"}));
    EXPECT_EQ(entry_after("#define MAX 10\n", "MAX"), "4:0|10 ");
    EXPECT_EQ(entry_after("#define m a b\n", "M"), "4:0|A B ");
}

TEST(Define, TheFirstStringIsQuotedTheOthersAreNot) {
    EXPECT_EQ(entry_after("#define GREETING \"hi\" there\n", "GREETING"), "4:0|\"hi\" THERE ");
    EXPECT_EQ(lex("#define GREETING \"hi\" there\nGREETING"), (Tokens{"s:hi", "id:THERE", "eof"}));
    EXPECT_EQ(entry_after("#define S \"a b\" \"c\" x\n", "S"), "4:0|\"a b\" c X ");
    // A quote inside the first string is not doubled again.
    EXPECT_EQ(entry_after("#define Q \"\"\"\"\n", "Q"), "4:0|\"\"\" ");
    EXPECT_EQ(lex("#define Q \"\"\"\"\nQ"), (Tokens{err(TPLEX_END_OF_LINE_IN_STRING), "eof"}));
}

TEST(Define, OperatorsByTheLowByteOfTheirValue) {
    EXPECT_EQ(entry_after("#define OPS a <= b != c + d ( ) ..\n", "OPS"),
              "4:0|A \x05 B \x0b C + D ( ) \x09 ");
    EXPECT_EQ(entry_after("#define P 1 <\"q\"> PROTOCOL -2 0x1F\n", "P"), "4:0|1 q PROTOCOL 2 1F ");
}

TEST(Define, AnOperatorAsFirstTokenTakesTheCurrentText) {
    // The name's own text: M's body begins with M and so names itself.
    EXPECT_EQ(entry_after("#define M + 1\n", "M"), "4:0|M 1 ");
    Tokens expected{err(TPLEX_TOO_MANY_MACRO_LEVELS)};
    for (int i = 0; i < 20; ++i) expected.push_back("n:1:1");
    expected.push_back("eof");
    EXPECT_EQ(lex("#define M + 1\nM"), expected);
}

TEST(Define, TheEndOfInputRightAfterTheNameStartsABody) {
    EXPECT_EQ(entry_after("#define E", "E"), "4:0|E ");
    EXPECT_EQ(entry_after("#define E 5", "E"), "4:0|5 ");
}

TEST(Define, ALineCommentContinuesTheBody) {
    EXPECT_EQ(entry_after("#define X 5 // more\n6\n", "X"), "4:0|5 6 ");
    EXPECT_EQ(lex("#define X 5 // more\n6\nX"), (Tokens{"n:5:5", "n:6:6", "eof"}));
}

TEST(Define, ANameWithABodyInsideABodyEndsIt) {
    EXPECT_EQ(lex("#define A 1\n#define B A 2\nB"), (Tokens{"n:2:2", "n:1:1", "eof"}));
    EXPECT_EQ(entry_after("#define A 1\n#define B x A 2\n", "B"), "4:0|X 1 ");
}

TEST(Define, ANameWithABodyWrittenAfterDefineAgain) {
    // The body's first token takes the name's place; the end of the
    // expansion is the end of the line for the directive.
    EXPECT_EQ(lex("#define MAX 10\n#define MAX 20\nMAX"),
              (Tokens{err(TPLEX_BAD_HASH_WORD), "n:20:20", "n:10:10", "eof"}));
    EXPECT_EQ(lex("#define S zz\n#define S 20\nzz S"), (Tokens{"n:20:20", "def:ZZ:0", "def:ZZ:0", "eof"}));
}

TEST(Define, DefiningAgain) {
    EXPECT_EQ(lex("#define D\n#define D 5 6\nx"), (Tokens{err(TPLEX_MACRO_REDEFINED), "n:6:6", "id:X", "eof"}));
    EXPECT_EQ(lex("#define D\n#define D\nx"), (Tokens{err(TPLEX_UNEXPECTED_HASH_WORD), "id:X", "eof"}));
    EXPECT_EQ(lex_with_defines("#define D 5\nD", {"d"}), (Tokens{err(TPLEX_MACRO_REDEFINED), "def:D:2", "eof"}));
    EXPECT_EQ(lex_with_defines("#define D\nD", {"d"}), (Tokens{err(TPLEX_UNEXPECTED_HASH_WORD), "def:D:2", "eof"}));
    // A keyword as the name.
    EXPECT_EQ(lex("#define protocol\nx"), (Tokens{err(TPLEX_UNEXPECTED_HASH_WORD), "id:X", "eof"}));
    EXPECT_EQ(lex("#define protocol 1\nx"), (Tokens{err(TPLEX_MACRO_REDEFINED), "id:X", "eof"}));
}

TEST(Define, ANameThatIsNoIdentifier) {
    EXPECT_EQ(lex("#define 12\nx"), (Tokens{err(TPLEX_BAD_HASH_WORD), "id:X", "eof"}));
    EXPECT_EQ(lex("#define \"s\"\nx"), (Tokens{err(TPLEX_BAD_HASH_WORD), "id:X", "eof"}));
    // A string name with a body is stored under its text.
    EXPECT_EQ(entry_after("#define \"s t\" 1\n", "S T"), "4:0|1 ");
}

TEST(Define, TokensNotAllowedAfterTheFirst) {
    EXPECT_EQ(lex("#define A\n#define B 1 A 2\nB"), (Tokens{err(TPLEX_MACRO_BAD_TOKEN), "n:2:2", "id:B", "eof"}));
    EXPECT_EQ(lex("#define B 1 'c' 2\nB"), (Tokens{err(TPLEX_MACRO_BAD_TOKEN), "n:2:2", "id:B", "eof"}));
    // As the first token the same name is accepted.
    EXPECT_EQ(lex("#define A\n#define B A 1\nB"), (Tokens{"def:A:0", "n:1:1", "eof"}));
    EXPECT_EQ(entry_after("#define B 'c' 1\n", "B"), "4:0|c 1 ");
}

TEST(Define, ScannerFailuresInsideTheLineAreNotPassedOn) {
    // The record as the scanner left it counts as the token read.
    EXPECT_EQ(entry_after("#define B a $ b\n", "B"), "4:0|A A B ");
    EXPECT_EQ(entry_after("#define B a 12x b\n", "B"), "4:0|A 12 X B ");
}

TEST(Define, BodyLengthLimit) {
    // "A " then 226 words of 10 characters with their blanks: 2488
    // characters; a last word of 9 gives 2488 + 9 + 2 = 2499 and is taken,
    // a last word of 10 reaches 2500 and is refused.
    std::string line = "#define L a";
    for (int i = 0; i < 226; ++i) line += " " + rep('w', 10);
    EXPECT_EQ(entry_after(line + " " + rep('z', 9) + "\n", "L").size(), 4u + 2488 + 10);
    EXPECT_EQ(lex(line + " " + rep('z', 10) + "\n").front(), err(TPLEX_MACRO_TOO_LONG));
    EXPECT_EQ(entry_after(line + " " + rep('z', 10) + "\n", "L"), "absent");
}

TEST(Define, FirstStringLimit) {
    // Quoted and with its blank the string must fit 2499 characters.
    const std::string ok(2496, 's');
    EXPECT_EQ(entry_after("#define S \"" + ok + "\"\n", "S"), "4:0|\"" + ok + "\" ");
    EXPECT_EQ(lex("#define S \"" + ok + "\"\nS"), (Tokens{"s:" + ok, "eof"}));
    const std::string too_long(2497, 's');
    EXPECT_EQ(lex("#define S \"" + too_long + "\"\nS"), (Tokens{err(TPLEX_MACRO_TOO_LONG), "id:S", "eof"}));
}

TEST(Define, FirstPdfStringLimit) {
    const std::string ok(2498, 'p');
    EXPECT_EQ(entry_after("#define P <\"" + ok + "\">\n", "P"), "4:0|" + ok + " ");
    const std::string too_long(2499, 'p');
    EXPECT_EQ(lex("#define P <\"" + too_long + "\">\nP"), (Tokens{err(TPLEX_MACRO_TOO_LONG), "id:P", "eof"}));
}

TEST(Define, AFailureEndsTheCallAndTheNextCallScansOn) {
    EXPECT_EQ(lex("#define D\n#define D 5 6 7\nx"),
              (Tokens{err(TPLEX_MACRO_REDEFINED), "n:6:6", "n:7:7", "id:X", "eof"}));
    EXPECT_EQ(lex("#define B 1 'c' 2 3\nx"),
              (Tokens{err(TPLEX_MACRO_BAD_TOKEN), "n:2:2", "n:3:3", "id:X", "eof"}));
}

// ---------------------------------------------------------------- #ifdef

TEST(Ifdef, LiveAndSwitchedOff) {
    EXPECT_EQ(lex("#define DEBUG\n#ifdef DEBUG\na\n#endif\nb"), (Tokens{"id:A", "id:B", "eof"}));
    EXPECT_EQ(lex("#define DEBUG\n#ifndef DEBUG\na\n#endif\nb"), (Tokens{"id:B", "eof"}));
    EXPECT_EQ(lex("#ifdef NOPE\na\n#endif\nb"), (Tokens{"id:B", "eof"}));
    EXPECT_EQ(lex("#ifndef NOPE\na\n#endif\nb"), (Tokens{"id:A", "id:B", "eof"}));
    EXPECT_EQ(lex("ifdef NOPE\na\nendif\nb"), (Tokens{"id:B", "eof"}));
    EXPECT_EQ(lex_with_defines("#ifdef TRACE\na\n#endif\nb", {"trace"}), (Tokens{"id:A", "id:B", "eof"}));
}

TEST(Ifdef, TheRestOfTheLineBelongsToTheNewRegion) {
    EXPECT_EQ(lex("#ifdef NOPE a\nb #endif c\nd"), (Tokens{"id:C", "id:D", "eof"}));
}

TEST(Ifdef, ANameWithABodyTestsItsFirstToken) {
    EXPECT_EQ(lex("#define M zz\n#ifdef M\na\n#endif\nb"), (Tokens{"id:B", "eof"}));
    EXPECT_EQ(lex("#define M zz\n#ifndef M\na\n#endif\nb"), (Tokens{"id:A", "id:B", "eof"}));
    EXPECT_EQ(lex("#define M 7\n#ifdef M\na\n#endif\nb"), (Tokens{err(TPLEX_BAD_HASH_WORD), "id:B", "eof"}));
}

TEST(Ifdef, OtherTokensAreRefusedAndTheRegionIsPushedAllTheSame) {
    EXPECT_EQ(lex("#ifdef protocol\na\n#endif\nb"), (Tokens{err(TPLEX_BAD_HASH_WORD), "id:B", "eof"}));
    EXPECT_EQ(lex("#ifndef protocol\na\n#endif\nb"), (Tokens{err(TPLEX_BAD_HASH_WORD), "id:B", "eof"}));
    EXPECT_EQ(lex("#ifdef 5\na\n#endif\nb"), (Tokens{err(TPLEX_BAD_HASH_WORD), "id:B", "eof"}));
    // A scanner failure on the name is the result, pushed all the same.
    EXPECT_EQ(lex("#ifdef $\na\n#endif\nb"), (Tokens{err(TPLEX_BAD_HASH_WORD), "id:B", "eof"}));
}

TEST(Ifdef, NestedSwitchedOffRegions) {
    EXPECT_EQ(lex("#ifdef NO\n#ifndef ALSO\nx\n#endif\ny\n#endif\nz"), (Tokens{"id:Z", "eof"}));
    // Inside a switched-off region the name is not examined.
    EXPECT_EQ(lex("#ifdef NO\n#ifdef protocol\nx\n#endif\n#endif\nz"), (Tokens{"id:Z", "eof"}));
    // ... but #define still reads its body and reports.
    EXPECT_EQ(lex("#define D\n#ifdef NO\n#define D 5\n#endif\nz"), (Tokens{err(TPLEX_MACRO_REDEFINED), "id:Z", "eof"}));
    EXPECT_EQ(lex("#define K\n#ifdef NO\n#define M 1 K\n#endif\nz"), (Tokens{err(TPLEX_MACRO_BAD_TOKEN), "id:Z", "eof"}));
    EXPECT_EQ(lex("#ifdef NO\n#define M \"" + rep('s', 2497) + "\"\n#endif\nz"),
              (Tokens{err(TPLEX_MACRO_TOO_LONG), "id:Z", "eof"}));
    // ... and stores nothing.
    EXPECT_EQ(lex("#ifdef NO\n#define M 5\n#define N\n#endif\nM N"), (Tokens{"id:M", "id:N", "eof"}));
    // #define without a body of a known name is not checked there.
    EXPECT_EQ(lex("#define D\n#ifdef NO\n#define D\n#endif\nz"), (Tokens{"id:Z", "eof"}));
    // Tokens, scanner failures and #include lines are skipped.
    EXPECT_EQ(lex("#ifdef NO\n$ 12ab #foo '\n#include \"/no/such/file\"\n#endif\nz"), (Tokens{"id:Z", "eof"}));
}

TEST(Ifdef, TwentyNestedRegionsAndNoMore) {
    std::string open20, close20;
    for (int i = 0; i < 20; ++i) {
        open20 += "#ifndef N\n";
        close20 += "#endif\n";
    }
    EXPECT_EQ(lex(open20 + "a\n" + close20 + "b"), (Tokens{"id:A", "id:B", "eof"}));
    EXPECT_EQ(lex(open20 + "#ifndef N\na\n" + close20 + "#endif\nb"),
              (Tokens{err(TPLEX_TOO_MANY_COND_LEVELS), "id:A", err(TPLEX_EXTRA_ENDIF), "id:B", "eof"}));
    {
        LexSession s;
        ASSERT_EQ(s.open(open20 + "#ifdef N\na\n"), 1);
        EXPECT_EQ(LexSession::all_described(), (Tokens{err(TPLEX_TOO_MANY_COND_LEVELS), "id:A", "eof"}));
        EXPECT_EQ(tplex::cond_depth, 20);
    }
}

TEST(Endif, WithoutAnOpenRegion) {
    EXPECT_EQ(lex("#endif\nx"), (Tokens{err(TPLEX_EXTRA_ENDIF), "id:X", "eof"}));
    EXPECT_EQ(lex("#ifdef N\n#endif\n#endif x\ny"), (Tokens{err(TPLEX_EXTRA_ENDIF), "id:X", "id:Y", "eof"}));
}

TEST(Endif, UnbalancedAtTheEnd) {
    EXPECT_EQ(lex("#ifdef NO\na"), (Tokens{"eof"}));
    EXPECT_EQ(lex("#ifndef NO\na"), (Tokens{"id:A", "eof"}));
}

// ---------------------------------------------------------------- #include

TEST(Include, TheRestOfTheLineIsNeverRead) {
    LexSession s;
    const std::string inc = s.file("inc.src", "x\n");
    ASSERT_EQ(s.open("#include \"" + inc + "\" EXTRA $ \"\nb"), 1);
    EXPECT_EQ(LexSession::all_described(), (Tokens{"id:X", "id:B", "eof"}));
}

TEST(Include, InASwitchedOffRegion) {
    LexSession s;
    const std::string inc = s.file("inc.src", "x\n");
    ASSERT_EQ(s.open("#ifdef NO\n#include \"" + inc + "\"\n#endif\nb"), 1);
    EXPECT_EQ(LexSession::all_described(), (Tokens{"id:B", "eof"}));
}

TEST(Include, AFileThatCannotBeOpened) {
    LexSession s;
    ASSERT_EQ(s.open("#include \"" + s.dir().path() + "/missing.src\" x\nb"), 1);
    const Token t = LexSession::next();
    EXPECT_LT(t.result, 0);
    EXPECT_EQ(LexSession::all_described(), (Tokens{"id:X", "id:B", "eof"}));
}

TEST(Include, DefinitionsCarryAcrossFiles) {
    LexSession s;
    const std::string inc = s.file("inc.src", "#define V 42\n#ifdef NO\n");
    ASSERT_EQ(s.open("#include \"" + inc + "\"\nV\n#endif\nV"), 1);
    EXPECT_EQ(LexSession::all_described(), (Tokens{"n:42:42", "eof"}));
}

// ---------------------------------------------------------------- others

TEST(HashWords, ADeclaredIdentifierOfClass24IsExecuted) {
    LexSession s;
    ASSERT_EQ(s.open("foo x foo y"), 1);
    ASSERT_EQ(parse_ident(1, 24), 0);  // FOO: kind 24, number 2
    EXPECT_EQ(LexSession::all_described(),
              (Tokens{"id:X", err(TPLEX_UNEXPECTED_HASH_WORD), "id:Y", "eof"}));
}

TEST(InitDefines, DefinesNamesInUpperCase) {
    LexSession s;
    char debug[] = "debug";
    char trace[] = "Trace";
    char *names[] = {debug, trace};
    ASSERT_EQ(sc_lex_init_defines(names, 2), 0);
    EXPECT_STREQ(debug, "DEBUG");
    EXPECT_STREQ(trace, "TRACE");
    EXPECT_EQ(entry("debug"), "25:2");
    EXPECT_EQ(entry("TRACE"), "25:2");
}

TEST(InitDefines, AKnownNameStopsTheList) {
    LexSession s;
    char a[] = "a";
    char b[] = "A";
    char c[] = "c";
    char *names[] = {a, b, c};
    EXPECT_EQ(sc_lex_init_defines(names, 3), TPLEX_ALREADY_DEFINED);
    EXPECT_EQ(entry("A"), "25:2");
    EXPECT_EQ(entry("C"), "absent");
    char p[] = "protocol";
    char *kw[] = {p};
    EXPECT_EQ(sc_lex_init_defines(kw, 1), TPLEX_ALREADY_DEFINED);
    EXPECT_STREQ(p, "PROTOCOL");
    EXPECT_EQ(entry("PROTOCOL"), "9:0");
}

TEST(InitDefines, CountZeroOrLessDefinesNothing) {
    LexSession s;
    char a[] = "a";
    char *names[] = {a};
    EXPECT_EQ(sc_lex_init_defines(names, 0), 0);
    EXPECT_EQ(sc_lex_init_defines(names, -1), 0);
    EXPECT_STREQ(a, "a");
    EXPECT_EQ(entry("A"), "absent");
}


TEST(Define, WithoutMemoryForTheNameCopy) {
    LexSession s;
    ASSERT_EQ(s.open("#define X 1 2\nX"), 1);
    tplex::mem_fail_at(1);
    EXPECT_EQ(LexSession::next().result, TPLEX_MALLOC_FAILED);
    tplex::mem_fail_at(0);
    EXPECT_EQ(LexSession::all_described(), (Tokens{"n:1:1", "n:2:2", "id:X", "eof"}));
}

TEST(Define, AnInsertWithoutMemoryIsNotReported) {
    LexSession s;
    ASSERT_EQ(s.open("#define X 1 2\n#define Y\nX Y"), 1);
    tplex::mem_fail_at(2);  // the name copy, then the entry
    EXPECT_EQ(LexSession::all_described(), (Tokens{"id:X", "def:Y:0", "eof"}));
    tplex::mem_fail_at(0);
}


TEST(Directives, NothingAfterTheHashWord) {
    // The name's scan meets the end of the line: the record still holds the
    // hash word, and that is the name.
    EXPECT_EQ(lex("#define\nX 5"), (Tokens{err(TPLEX_MACRO_REDEFINED), "n:5:5", "eof"}));
    EXPECT_EQ(lex("#ifdef\nx\n#endif\ny"), (Tokens{err(TPLEX_BAD_HASH_WORD), "id:Y", "eof"}));
    EXPECT_EQ(lex("#ifdef"), (Tokens{err(TPLEX_BAD_HASH_WORD), "eof"}));
}


TEST(Include, ADefineOnTheLastLineOfAFileWithoutALineFeed) {
    // The file's last character is followed directly by the includer's next
    // line, so that line becomes the body: DEBUG is a name with the body
    // "IFDEF DEBUG ", the #ifdef never runs and its #endif has no region.
    LexSession s;
    const std::string inc = s.file("config.src", "#define DEBUG");
    ASSERT_EQ(s.open("#include \"" + inc + "\"\n#ifdef DEBUG\nx\n#endif\ny"), 1);
    EXPECT_EQ(LexSession::all_described(), (Tokens{"id:X", err(TPLEX_EXTRA_ENDIF), "id:Y", "eof"}));
    EXPECT_EQ(entry("DEBUG"), "4:0|IFDEF DEBUG ");
}

}  // namespace
