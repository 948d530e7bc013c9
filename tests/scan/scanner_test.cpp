// The token scanner through real files: one line per case, the tokens that
// sc_next_token hands out in their short form (see lex_harness.h).
#include <gtest/gtest.h>

#include <string>

#include "lex/lexer.h"
#include "lex_harness.h"
#include "scan/char_source.h"
#include "scan/scanner.h"

using namespace std::string_literals;
using tplex::test::err;
using tplex::test::lex;
using tplex::test::LexSession;
using tplex::test::Token;
using tplex::test::Tokens;

namespace {

std::string rep(char c, std::size_t n) { return std::string(n, c); }

// ---------------------------------------------------------------- numbers

TEST(ScannerNumbers, DecimalHexBinary) {
    EXPECT_EQ(lex("0"), (Tokens{"n:0:0", "eof"}));
    EXPECT_EQ(lex("007"), (Tokens{"n:7:007", "eof"}));
    EXPECT_EQ(lex("0x1F"), (Tokens{"n:31:1F", "eof"}));
    EXPECT_EQ(lex("0X1f"), (Tokens{"n:31:1f", "eof"}));
    EXPECT_EQ(lex("0b101"), (Tokens{"n:5:101", "eof"}));
    EXPECT_EQ(lex("0B11"), (Tokens{"n:3:11", "eof"}));
    EXPECT_EQ(lex("-12"), (Tokens{"n:-12:12", "eof"}));
    EXPECT_EQ(lex("-0x10"), (Tokens{"n:-16:10", "eof"}));
    EXPECT_EQ(lex("32768"), (Tokens{"n:32768:32768", "eof"}));
}

TEST(ScannerNumbers, MinusDirectlyBeforeADigitMakesANegativeNumber) {
    EXPECT_EQ(lex("x-1"), (Tokens{"id:X", "n:-1:1", "eof"}));
    EXPECT_EQ(lex("x - 1"), (Tokens{"id:X", "op:45", "n:1:1", "eof"}));
    EXPECT_EQ(lex("x -1"), (Tokens{"id:X", "n:-1:1", "eof"}));
    EXPECT_EQ(lex("--1"), (Tokens{"op:45", "n:-1:1", "eof"}));
    EXPECT_EQ(lex("-x"), (Tokens{"op:45", "id:X", "eof"}));
    EXPECT_EQ(lex("5-3"), (Tokens{"n:5:5", "n:-3:3", "eof"}));
}

TEST(ScannerNumbers, HexLettersAreReadButRefusedInBaseTen) {
    LexSession s;
    ASSERT_EQ(s.open("12ab"), 1);
    const Token t = LexSession::next();
    EXPECT_EQ(t.result, TPLEX_BAD_DIGIT);
    EXPECT_EQ(t.text, "12a");
    EXPECT_EQ(t.value, 12);  // what was accumulated before the refused digit
    EXPECT_EQ(t.kind, tk_hash_word);  // kind unchanged: the last keyword loaded
    EXPECT_EQ(LexSession::all_described(), (Tokens{"id:B", "eof"}));
}

TEST(ScannerNumbers, ALetterThatIsNoHexDigitEndsTheNumber) {
    EXPECT_EQ(lex("12g"), (Tokens{"n:12:12", "id:G", "eof"}));
    EXPECT_EQ(lex("0x1G"), (Tokens{"n:1:1", "id:G", "eof"}));
    EXPECT_EQ(lex("0b102"), (Tokens{err(TPLEX_BAD_DIGIT), "eof"}));
    EXPECT_EQ(lex("0b2"), (Tokens{err(TPLEX_BAD_DIGIT), "eof"}));
    EXPECT_EQ(lex("09a"), (Tokens{err(TPLEX_BAD_DIGIT), "eof"}));
}

TEST(ScannerNumbers, APrefixFollowedByNoDigitFails) {
    EXPECT_EQ(lex("0x "), (Tokens{err(TPLEX_BAD_DIGIT), "eof"}));
    EXPECT_EQ(lex("0x\n5"), (Tokens{err(TPLEX_BAD_DIGIT), "n:5:5", "eof"}));
    EXPECT_EQ(lex("0xg1"), (Tokens{err(TPLEX_BAD_DIGIT), "n:1:1", "eof"}));
    // The character after the prefix is taken whatever it is.
    EXPECT_EQ(lex("0x+1"), (Tokens{err(TPLEX_BAD_DIGIT), "n:1:1", "eof"}));
}

TEST(ScannerNumbers, ThirtyTwoBitWrap) {
    EXPECT_EQ(lex("4294967295"), (Tokens{"n:-1:4294967295", "eof"}));
    EXPECT_EQ(lex("4294967296"), (Tokens{"n:0:4294967296", "eof"}));
    EXPECT_EQ(lex("4294967297"), (Tokens{"n:1:4294967297", "eof"}));
    EXPECT_EQ(lex("0xFFFFFFFF"), (Tokens{"n:-1:FFFFFFFF", "eof"}));
    EXPECT_EQ(lex("0x100000002"), (Tokens{"n:2:100000002", "eof"}));
    EXPECT_EQ(lex("2147483648"), (Tokens{"n:-2147483648:2147483648", "eof"}));
}

TEST(ScannerNumbers, NegativeWrap) {
    EXPECT_EQ(lex("-2147483648"), (Tokens{"n:-2147483648:2147483648", "eof"}));
    EXPECT_EQ(lex("-4294967295"), (Tokens{"n:1:4294967295", "eof"}));
    EXPECT_EQ(lex("-4294967296"), (Tokens{"n:0:4294967296", "eof"}));
    EXPECT_EQ(lex("-0xFFFFFFFF"), (Tokens{"n:1:FFFFFFFF", "eof"}));
}

TEST(ScannerNumbers, LongerThan128DigitsKeeps128) {
    const std::string digits = rep('0', 125) + "12345";  // 130 digits, value 12345
    EXPECT_EQ(lex(digits + " x"), (Tokens{"n:12345:" + digits.substr(0, 128), "id:X", "eof"}));
}

// ---------------------------------------------------------------- words

TEST(ScannerWords, UpperCaseAndLookup) {
    EXPECT_EQ(lex("abc"), (Tokens{"id:ABC", "eof"}));
    EXPECT_EQ(lex("a_b1 Z9"), (Tokens{"id:A_B1", "id:Z9", "eof"}));
    EXPECT_EQ(lex("protocol Window"), (Tokens{"rw:0", "rw:117", "eof"}));
    EXPECT_EQ(lex("_a"), (Tokens{err(TPLEX_BAD_CHARACTER), "id:A", "eof"}));
}

TEST(ScannerWords, ANewIdentifierKeepsTheValueOfTheTokenBefore) {
    LexSession s;
    ASSERT_EQ(s.open("77 abc"), 1);
    EXPECT_EQ(LexSession::next().value, 77);
    const Token t = LexSession::next();
    EXPECT_EQ(t.kind, tk_new_identifier);
    EXPECT_EQ(t.value, 77);
}

TEST(ScannerWords, LongerThan128LettersKeeps128) {
    const std::string word = rep('a', 100) + rep('b', 30);
    const std::string kept = rep('A', 100) + rep('B', 28);
    EXPECT_EQ(lex(word + " c"), (Tokens{"id:" + kept, "id:C", "eof"}));
}

TEST(ScannerWords, HashWordsNeedTheirHashDirectlyBefore) {
    EXPECT_EQ(lex("#foo x"), (Tokens{err(TPLEX_EXTRA_ENDIF), "id:X", "eof"}));
    EXPECT_EQ(lex("#1"), (Tokens{err(TPLEX_EXTRA_ENDIF), "eof"}));
    EXPECT_EQ(lex("#protocol"), (Tokens{err(TPLEX_EXTRA_ENDIF), "eof"}));
    EXPECT_EQ(lex("# define X\nX"), (Tokens{err(TPLEX_EXTRA_ENDIF), "def:X:0", "eof"}));
    EXPECT_EQ(lex("#"), (Tokens{err(TPLEX_EXTRA_ENDIF), "eof"}));
}

TEST(ScannerWords, HashWordTextIsTheWordInUpperCase) {
    LexSession s;
    ASSERT_EQ(s.open("#foo"), 1);
    const Token t = LexSession::next();
    EXPECT_EQ(t.result, TPLEX_EXTRA_ENDIF);
    EXPECT_EQ(t.text, "FOO");
    EXPECT_EQ(t.value, 0);
}

// ---------------------------------------------------------------- operators

TEST(ScannerOperators, OneCharacter) {
    EXPECT_EQ(lex("% ( ) * + , : ; = [ ] { } ~"),
              (Tokens{"op:37", "op:40", "op:41", "op:42", "op:43", "op:44", "op:58", "op:59",
                      "op:61", "op:91", "op:93", "op:123", "op:125", "op:126", "eof"}));
    EXPECT_EQ(lex("! & - . / < > ^ |"),
              (Tokens{"op:33", "op:38", "op:45", "op:46", "op:47", "op:60", "op:62", "op:94",
                      "op:124", "eof"}));
}

TEST(ScannerOperators, TwoCharacters) {
    EXPECT_EQ(lex("/= || && <= >= << >> .. ^^ !="),
              (Tokens{"op:2", "op:3", "op:4", "op:5", "op:6", "op:7", "op:8", "op:9", "op:10",
                      "op:11", "eof"}));
}

TEST(ScannerOperators, LookAheadOrder) {
    EXPECT_EQ(lex("< ="), (Tokens{"op:60", "op:61", "eof"}));
    EXPECT_EQ(lex("<<="), (Tokens{"op:7", "op:61", "eof"}));
    EXPECT_EQ(lex("<=<"), (Tokens{"op:5", "op:60", "eof"}));
    EXPECT_EQ(lex("<=="), (Tokens{"op:5", "op:61", "eof"}));
    EXPECT_EQ(lex(">>="), (Tokens{"op:8", "op:61", "eof"}));
    EXPECT_EQ(lex(">=>"), (Tokens{"op:6", "op:62", "eof"}));
    EXPECT_EQ(lex("!=="), (Tokens{"op:11", "op:61", "eof"}));
    EXPECT_EQ(lex("..."), (Tokens{"op:9", "op:46", "eof"}));
    EXPECT_EQ(lex("|||"), (Tokens{"op:3", "op:124", "eof"}));
    EXPECT_EQ(lex("&&&"), (Tokens{"op:4", "op:38", "eof"}));
    EXPECT_EQ(lex("^^^"), (Tokens{"op:10", "op:94", "eof"}));
    EXPECT_EQ(lex("/=="), (Tokens{"op:2", "op:61", "eof"}));
    EXPECT_EQ(lex("=<"), (Tokens{"op:61", "op:60", "eof"}));
    EXPECT_EQ(lex("a<=b"), (Tokens{"id:A", "op:5", "id:B", "eof"}));
}

TEST(ScannerOperators, AnOperatorLeavesTheTextAlone) {
    LexSession s;
    ASSERT_EQ(s.open("abc +"), 1);
    LexSession::next();
    const Token t = LexSession::next();
    EXPECT_EQ(t.kind, tk_operator);
    EXPECT_EQ(t.text, "ABC");
}

TEST(ScannerOperators, BadCharacters) {
    for (const std::string c : {"$", "?", "@", "\\", "`", "\x7f", "\x80", "\xfa", "\xfe", "\r",
                                "\x01", "\x08", "\x0b", "\x0c", "\x1f", "*/"}) {
        EXPECT_EQ(lex("a " + c + " b"), (Tokens{"id:A", err(TPLEX_BAD_CHARACTER), "id:B", "eof"}))
            << "character code " << static_cast<int>(static_cast<unsigned char>(c[0]));
    }
}

// ---------------------------------------------------------------- strings

TEST(ScannerStrings, Plain) {
    EXPECT_EQ(lex("\"abc\""), (Tokens{"s:abc", "eof"}));
    EXPECT_EQ(lex("\"\""), (Tokens{"s:", "eof"}));
    EXPECT_EQ(lex("\"a\"\"b\""), (Tokens{"s:a\"b", "eof"}));
    EXPECT_EQ(lex("\"\"\"\""), (Tokens{"s:\"", "eof"}));
    EXPECT_EQ(lex("\"a\" \"b\""), (Tokens{"s:a", "s:b", "eof"}));
    EXPECT_EQ(lex("\"it's\""), (Tokens{"s:it's", "eof"}));
}

TEST(ScannerStrings, AcrossLinesKeepsTheLineFeeds) {
    EXPECT_EQ(lex("\"a\nb\n\" x"), (Tokens{"s:a\nb\n", "id:X", "eof"}));
}

TEST(ScannerStrings, CommentBracketsInsideAreSingleCodes) {
    EXPECT_EQ(lex("\"a/*b*/c//d\""), (Tokens{"s:a\xfb" "b\xfc" "c\xfd" "d", "eof"}));
    EXPECT_EQ(lex("\"/*\" x"), (Tokens{"s:\xfb", "id:X", "eof"}));
}

TEST(ScannerStrings, AtTheEndOfInputFails) {
    LexSession s;
    ASSERT_EQ(s.open("\"abc"), 1);
    const Token t = LexSession::next();
    EXPECT_EQ(t.result, TPLEX_END_OF_LINE_IN_STRING);
    EXPECT_EQ(t.kind, tk_string);
    EXPECT_EQ(t.text, "abc");
    EXPECT_EQ(LexSession::all_described(), (Tokens{"eof"}));
    EXPECT_EQ(lex("\"abc\n"), (Tokens{err(TPLEX_END_OF_LINE_IN_STRING), "eof"}));
}

TEST(ScannerStrings, LongerThan2499Keeps2499) {
    const std::string body = rep('a', 2000) + rep('b', 1000);
    EXPECT_EQ(lex("\"" + body + "\" x"), (Tokens{"s:" + body.substr(0, 2499), "id:X", "eof"}));
    EXPECT_EQ(lex("\"" + rep('c', 2499) + "\""), (Tokens{"s:" + rep('c', 2499), "eof"}));
}

TEST(ScannerStrings, PdfStrings) {
    EXPECT_EQ(lex("<\"abc\">"), (Tokens{"pdf:abc", "eof"}));
    EXPECT_EQ(lex("<\"\">"), (Tokens{"pdf:", "eof"}));
    EXPECT_EQ(lex("<\"a\"\"b\">"), (Tokens{"pdf:a\"b", "eof"}));
    EXPECT_EQ(lex("<\"a\nb\"> x"), (Tokens{"pdf:a\nb", "id:X", "eof"}));
    EXPECT_EQ(lex("< \"a\""), (Tokens{"op:60", "s:a", "eof"}));
}

TEST(ScannerStrings, BadPdfStrings) {
    LexSession s;
    ASSERT_EQ(s.open("<\"abc\"x"), 1);
    const Token t = LexSession::next();
    EXPECT_EQ(t.result, TPLEX_BAD_PDF_STRING);
    EXPECT_EQ(t.kind, tk_pdf_string);
    EXPECT_EQ(t.text, "abc");
    EXPECT_EQ(LexSession::all_described(), (Tokens{"id:X", "eof"}));

    EXPECT_EQ(lex("<\"abc\" >"), (Tokens{err(TPLEX_BAD_PDF_STRING), "op:62", "eof"}));
    EXPECT_EQ(lex("<\"abc"), (Tokens{err(TPLEX_END_OF_LINE_IN_STRING), "eof"}));
}

// ---------------------------------------------------------------- characters

TEST(ScannerChars, Literals) {
    EXPECT_EQ(lex("'a'"), (Tokens{"ch:a", "eof"}));
    EXPECT_EQ(lex("'''"), (Tokens{"ch:'", "eof"}));
    EXPECT_EQ(lex("' '"), (Tokens{"ch: ", "eof"}));
    EXPECT_EQ(lex("'\n'"), (Tokens{"ch:\n", "eof"}));
    EXPECT_EQ(lex("'/*'"), (Tokens{"ch:\xfb", "eof"}));
}

TEST(ScannerChars, NotClosedByAQuote) {
    LexSession s;
    ASSERT_EQ(s.open("'ab x"), 1);
    const Token t = LexSession::next();
    EXPECT_EQ(t.result, TPLEX_BAD_CHARACTER);
    EXPECT_EQ(t.kind, tk_char);
    EXPECT_EQ(t.text, "a");
    EXPECT_EQ(LexSession::all_described(), (Tokens{"id:X", "eof"}));
}

TEST(ScannerChars, AtTheEndOfInput) {
    EXPECT_EQ(lex("'"), (Tokens{err(TPLEX_END_OF_LINE_IN_CHAR), "eof"}));
    EXPECT_EQ(lex("'a"), (Tokens{err(TPLEX_BAD_CHARACTER), "eof"}));
}

// ---------------------------------------------------------------- comments

TEST(ScannerComments, BlockAndLine) {
    EXPECT_EQ(lex("a /* b */ c"), (Tokens{"id:A", "id:C", "eof"}));
    EXPECT_EQ(lex("a /* b\n c */ d"), (Tokens{"id:A", "id:D", "eof"}));
    EXPECT_EQ(lex("a // b\nc"), (Tokens{"id:A", "id:C", "eof"}));
    EXPECT_EQ(lex("a // b"), (Tokens{"id:A", "eof"}));
    EXPECT_EQ(lex("a /* b"), (Tokens{"id:A", "eof"}));
    EXPECT_EQ(lex("a/**/b"), (Tokens{"id:A", "id:B", "eof"}));
    EXPECT_EQ(lex("a /*/ b */ c"), (Tokens{"id:A", "id:C", "eof"}));
}

TEST(ScannerComments, BlockCommentsDoNotNest) {
    EXPECT_EQ(lex("/* /* */ x */"), (Tokens{"id:X", err(TPLEX_BAD_CHARACTER), "eof"}));
}

TEST(ScannerComments, MarkerBytesInAFile) {
    EXPECT_EQ(lex("a \xfb b \xfc c"), (Tokens{"id:A", "id:C", "eof"}));
    EXPECT_EQ(lex("a \xfb b */ c"), (Tokens{"id:A", "id:C", "eof"}));
    EXPECT_EQ(lex("a /* b \xfc c"), (Tokens{"id:A", "id:C", "eof"}));
    EXPECT_EQ(lex("a \xfd b\nc"), (Tokens{"id:A", "id:C", "eof"}));
    EXPECT_EQ(lex("a \xfc"), (Tokens{"id:A", err(TPLEX_BAD_CHARACTER), "eof"}));
}

TEST(ScannerComments, ByteFFIsTheEndOfInputAndReadingGoesOnAfterIt) {
    LexSession s;
    ASSERT_EQ(s.open("a \xff b"), 1);
    EXPECT_EQ(LexSession::all_described(), (Tokens{"id:A", "eof"}));
    EXPECT_EQ(LexSession::all_described(), (Tokens{"id:B", "eof"}));
    EXPECT_EQ(LexSession::all_described(), (Tokens{"eof"}));
}

// ---------------------------------------------------------------- lines

TEST(ScannerLines, NoFinalLineFeed) {
    EXPECT_EQ(lex("abc"), (Tokens{"id:ABC", "eof"}));
    EXPECT_EQ(lex(""), (Tokens{"eof"}));
    EXPECT_EQ(lex("\n\n\n"), (Tokens{"eof"}));
}

TEST(ScannerLines, NulBytesInsideALine) {
    // The rest of a line after a NUL byte is not read.
    EXPECT_EQ(lex("ab\0cd\nef\n"s), (Tokens{"id:AB", "id:EF", "eof"}));
    // A line that begins with a NUL ends there.
    EXPECT_EQ(lex("\0xy\nzz\n"s), (Tokens{"id:ZZ", "eof"}));
    // A string reaching a NUL in the middle of a line goes on in the next.
    EXPECT_EQ(lex("a\"b\0c\nd\"\n"s), (Tokens{"id:A", "s:bd", "eof"}));
    // A string reaching a line that begins with a NUL fails there.
    EXPECT_EQ(lex("\"ab\n\0x\ny\"\n"s),
              (Tokens{err(TPLEX_END_OF_LINE_IN_STRING), "id:Y", err(TPLEX_END_OF_LINE_IN_STRING),
                      "eof"}));
}

TEST(ScannerLines, LongLinesArriveInPiecesOf4999) {
    // A word ends where its piece ends.
    const std::string line = rep('a', 4999) + "bc\n";
    EXPECT_EQ(lex(line), (Tokens{"id:" + rep('A', 128), "id:BC", "eof"}));
    const std::string numbers = rep(' ', 4997) + "12" + "34\n";
    EXPECT_EQ(lex(numbers), (Tokens{"n:12:12", "n:34:34", "eof"}));
}

TEST(ScannerLines, ASlashAtTheEndOfAPieceOpensNoComment) {
    EXPECT_EQ(lex(rep(' ', 4998) + "/* 1 */\n"), (Tokens{"op:47", "op:42", "n:1:1", err(TPLEX_BAD_CHARACTER), "eof"}));
    EXPECT_EQ(lex(rep(' ', 4998) + "/= 1\n"), (Tokens{"op:47", "op:61", "n:1:1", "eof"}));
    EXPECT_EQ(lex(rep(' ', 4998) + "// 1\n"), (Tokens{"op:47", "op:47", "n:1:1", "eof"}));
    EXPECT_EQ(lex(rep(' ', 4998) + "-1\n"), (Tokens{"op:45", "n:1:1", "eof"}));
    // One character earlier the pair is inside the piece.
    EXPECT_EQ(lex(rep(' ', 4997) + "/* 1 */\n"), (Tokens{"eof"}));
}

TEST(ScannerLines, AStringRunsAcrossPieces) {
    const std::string text = rep('x', 5200);
    EXPECT_EQ(lex(rep(' ', 10) + "\"" + text + "\""), (Tokens{"s:" + text.substr(0, 2499), "eof"}));
}

// ---------------------------------------------------------------- files

TEST(ScannerFiles, NestedFilesEnd) {
    LexSession s;
    const std::string inner = s.file("inner.src", "i1\ni2");  // no final line feed
    const std::string middle = s.file("middle.src", "m1\n#include \"" + inner + "\" NOTREAD\nm2\n");
    ASSERT_EQ(s.open("a\n#include \"" + middle + "\" NOTREAD\nb"), 1);
    EXPECT_EQ(LexSession::all_described(),
              (Tokens{"id:A", "id:M1", "id:I1", "id:I2", "id:M2", "id:B", "eof"}));
}

TEST(ScannerFiles, AStringRunsFromAnIncludedFileIntoTheIncluder) {
    LexSession s;
    const std::string inner = s.file("inner.src", "\"abc");
    ASSERT_EQ(s.open("#include \"" + inner + "\"\nxyz\" q"), 1);
    EXPECT_EQ(LexSession::all_described(), (Tokens{"s:abcxyz", "id:Q", "eof"}));
}

TEST(ScannerFiles, AWordEndsWithItsFile) {
    LexSession s;
    const std::string inner = s.file("inner.src", "ab");
    ASSERT_EQ(s.open("#include \"" + inner + "\"\ncd"), 1);
    EXPECT_EQ(LexSession::all_described(), (Tokens{"id:AB", "id:CD", "eof"}));
}

// ---------------------------------------------------------------- macros

TEST(ScannerMacros, AWordEndsAtTheEndOfABody) {
    LexSession s;
    ASSERT_EQ(s.open("cd"), 1);
    ASSERT_EQ(tplex::push_macro("ab"), 0);
    EXPECT_EQ(LexSession::all_described(), (Tokens{"id:AB", "id:CD", "eof"}));
}

TEST(ScannerMacros, ANumberEndsAtTheEndOfABody) {
    LexSession s;
    ASSERT_EQ(s.open("34"), 1);
    ASSERT_EQ(tplex::push_macro("12"), 0);
    EXPECT_EQ(LexSession::all_described(), (Tokens{"n:12:12", "n:34:34", "eof"}));
}

TEST(ScannerMacros, StringsAndCharactersAtTheEndOfABody) {
    {
        LexSession s;
        ASSERT_EQ(s.open("x\"\n"), 1);
        ASSERT_EQ(tplex::push_macro("\"ab"), 0);
        EXPECT_EQ(LexSession::all_described(),
                  (Tokens{err(TPLEX_END_OF_LINE_IN_STRING), "id:X", err(TPLEX_END_OF_LINE_IN_STRING), "eof"}));
    }
    {
        LexSession s;
        ASSERT_EQ(s.open("x'\n"), 1);
        ASSERT_EQ(tplex::push_macro("'"), 0);
        const Token t = LexSession::next();
        EXPECT_EQ(t.result, TPLEX_END_OF_LINE_IN_CHAR);
        EXPECT_EQ(LexSession::all_described(), (Tokens{"id:X", err(TPLEX_BAD_CHARACTER), "eof"}));
    }
    {
        LexSession s;
        ASSERT_EQ(s.open("'\n"), 1);
        ASSERT_EQ(tplex::push_macro("'a"), 0);
        EXPECT_EQ(LexSession::all_described(), (Tokens{err(TPLEX_BAD_CHARACTER), err(TPLEX_BAD_CHARACTER), "eof"}));
    }
    {
        LexSession s;
        ASSERT_EQ(s.open("z"), 1);
        ASSERT_EQ(tplex::push_macro("<\"ab\""), 0);
        EXPECT_EQ(LexSession::all_described(), (Tokens{err(TPLEX_BAD_PDF_STRING), "id:Z", "eof"}));
    }
}

TEST(ScannerMacros, TwentyDeepAndNoDeeper) {
    // A name whose body names itself.
    EXPECT_EQ(lex("#define R R\nR\nz"), (Tokens{err(TPLEX_TOO_MANY_MACRO_LEVELS), "id:Z", "eof"}));
}

TEST(ScannerMacros, TwentyNestedNamesAreExpanded) {
    // Each name is defined before the name in its body, so the bodies stay
    // names: M1 -> M2 -> ... -> M20 -> 7 has twenty bodies pending at once.
    std::string text;
    for (int i = 0; i <= 20; ++i)
        text += "#define M" + std::to_string(i) + " " + (i == 20 ? "7" : "M" + std::to_string(i + 1)) + "\n";
    EXPECT_EQ(lex(text + "M1 M20 M19"), (Tokens{"n:7:7", "n:7:7", "n:7:7", "eof"}));
    // One more level is refused; the pending bodies then end one by one.
    EXPECT_EQ(lex(text + "M0 z"), (Tokens{err(TPLEX_TOO_MANY_MACRO_LEVELS), "id:Z", "eof"}));
}

TEST(ScannerMacros, ABodyLongerThan254IsReadToItsEnd) {
    std::string line = "#define L";
    Tokens expected;
    for (int i = 0; i < 100; ++i) {
        line += " w" + std::to_string(i);
        expected.push_back("id:W" + std::to_string(i));
    }
    expected.push_back("eof");
    EXPECT_EQ(lex(line + "\nL"), expected);
}

// ---------------------------------------------------------------- back_token

TEST(ScannerBackToken, TheSameRecordAgainThenOn) {
    LexSession s;
    ASSERT_EQ(s.open("abc 12"), 1);
    EXPECT_EQ(tplex::test::describe(LexSession::next()), "id:ABC");
    back_token();
    back_token();  // a second call changes nothing
    EXPECT_EQ(tplex::test::describe(LexSession::next()), "id:ABC");
    EXPECT_EQ(tplex::test::describe(LexSession::next()), "n:12:12");
    back_token();
    EXPECT_EQ(tplex::test::describe(LexSession::next()), "n:12:12");
    EXPECT_EQ(LexSession::all_described(), (Tokens{"eof"}));
    back_token();
    EXPECT_EQ(LexSession::all_described(), (Tokens{"eof"}));
}

TEST(ScannerBackToken, AFailureIsNotGivenBack) {
    // back_token returns the kind, not the failure: the record's kind.
    LexSession s;
    ASSERT_EQ(s.open("abc $ d"), 1);
    LexSession::next();
    EXPECT_EQ(LexSession::next().result, TPLEX_BAD_CHARACTER);
    back_token();
    EXPECT_EQ(tplex::test::describe(LexSession::next()), "id:ABC");
    EXPECT_EQ(LexSession::all_described(), (Tokens{"id:D", "eof"}));
}


// ---------------------------------------------------------------- scan_token

TEST(ScanToken, EndsOfLinesAndBodiesLeaveTheRecordAlone) {
    LexSession s;
    ASSERT_EQ(s.open("ab\n\ncd"), 1);
    ASSERT_EQ(tplex::push_macro("7"), 0);
    EXPECT_EQ(tplex::scan_token(), tk_number);
    EXPECT_EQ(tplex::scan_token(), tk_end_of_line);  // the end of the body
    EXPECT_EQ(tplex::test::describe(tplex::test::snapshot(tk_number)), "n:7:7");
    EXPECT_EQ(tplex::scan_token(), tk_new_identifier);
    EXPECT_EQ(tplex::scan_token(), tk_end_of_line);
    EXPECT_EQ(tplex::scan_token(), tk_end_of_line);
    EXPECT_EQ(tplex::test::describe(tplex::test::snapshot(tk_new_identifier)), "id:AB");
    EXPECT_EQ(tplex::scan_token(), tk_new_identifier);
    EXPECT_EQ(tplex::scan_token(), tk_end_of_input);
    EXPECT_EQ(tplex::scan_token(), tk_end_of_input);
}

TEST(ScanToken, HashWordsAndDefinedNamesAsTheScannerSeesThem) {
    LexSession s;
    ASSERT_EQ(s.open("#define define Include #IFNDEF\n"), 1);
    for (int code : {201, 201, 205, 203}) {
        EXPECT_EQ(tplex::scan_token(), tk_hash_word);
        EXPECT_EQ(tplex::current_token.value, code);
    }
    EXPECT_EQ(tplex::scan_token(), tk_end_of_line);
}

TEST(ScanToken, ALineCommentTakesItsLineFeed) {
    LexSession s;
    ASSERT_EQ(s.open("a // x\nb /* \n */ c\n"), 1);
    EXPECT_EQ(tplex::scan_token(), tk_new_identifier);
    EXPECT_EQ(tplex::scan_token(), tk_new_identifier);  // B: no end of line before it
    EXPECT_EQ(tplex::scan_token(), tk_new_identifier);  // C: the comment's line feed is inside it
    EXPECT_EQ(tplex::scan_token(), tk_end_of_line);
}

TEST(ScanToken, TheReadPositionIsInTheFrameAfterEachToken) {
    LexSession s;
    ASSERT_EQ(s.open("abc def\n"), 1);
    EXPECT_EQ(sc_next_token(), tk_new_identifier);
    source_frame *frames = nullptr;
    sc_lex_setup(nullptr, &frames, nullptr, nullptr, nullptr);
    EXPECT_EQ(frames[1].read_pos, 3);
    EXPECT_EQ(frames[1].line_no, 0u);
    EXPECT_EQ(sc_next_token(), tk_new_identifier);
    EXPECT_EQ(frames[1].read_pos, 7);
}

}  // namespace
