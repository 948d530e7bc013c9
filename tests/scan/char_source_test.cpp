// The character source on its own: macro bodies, files, line pieces and the
// comment markers, read through read_char, peek_char and next_char.
#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "lex_harness.h"
#include "scan/char_source.h"
#include "source/source_stack.h"

using namespace std::string_literals;
using tplex::next_char;
using tplex::peek_char;
using tplex::push_macro;
using tplex::read_char;
using tplex::test::LexSession;

namespace {

// The next n codes of a reader, as ints for readable failures.
template <typename F>
std::vector<int> take(F f, int n) {
    std::vector<int> out;
    for (int i = 0; i < n; ++i) out.push_back(f());
    return out;
}
std::vector<int> reads(int n) { return take([] { return read_char(); }, n); }
std::vector<int> nexts(int n) { return take([] { return next_char(); }, n); }

source_frame &frame(int depth) { return tplex::source_stack[depth]; }

TEST(CharSource, ABodyYieldsItsCharactersThenZeroThenWhatLiesBeneath) {
    LexSession s;
    ASSERT_EQ(s.open("q\n"), 1);
    ASSERT_EQ(push_macro("xy"), 0);
    ASSERT_EQ(push_macro("a b"), 0);
    EXPECT_EQ(tplex::macro_depth, 2);
    EXPECT_EQ(reads(10), (std::vector<int>{'a', ' ', 'b', 0, 'x', 'y', 0, 'q', '\n', 255}));
    EXPECT_EQ(tplex::macro_depth, 0);
}

TEST(CharSource, PeekAtTheLastCharacterOfABodyGivesABlank) {
    LexSession s;
    ASSERT_EQ(s.open("cd\n"), 1);
    ASSERT_EQ(push_macro("ab"), 0);
    EXPECT_EQ(peek_char(), 'a');
    EXPECT_EQ(read_char(), 'a');
    EXPECT_EQ(peek_char(), 'b');
    EXPECT_EQ(read_char(), 'b');
    EXPECT_EQ(peek_char(), ' ');  // the source goes on with a letter
    EXPECT_EQ(read_char(), 0);
    EXPECT_EQ(peek_char(), ' ');  // the frame is still there, read out
    EXPECT_EQ(read_char(), 'c');
    EXPECT_EQ(peek_char(), 'd');
}

TEST(CharSource, PeekDoesNotLookIntoTheFrameBelow) {
    LexSession s;
    ASSERT_EQ(s.open("z\n"), 1);
    ASSERT_EQ(push_macro("x"), 0);
    ASSERT_EQ(push_macro("a"), 0);
    EXPECT_EQ(read_char(), 'a');
    EXPECT_EQ(peek_char(), ' ');
    EXPECT_EQ(read_char(), 0);
    EXPECT_EQ(peek_char(), ' ');
    EXPECT_EQ(read_char(), 'x');
}

TEST(CharSource, TwentyBodiesAndNoMore) {
    LexSession s;
    for (int i = 0; i < 20; ++i) ASSERT_EQ(push_macro("m"), 0) << i;
    EXPECT_EQ(push_macro("m"), TPLEX_TOO_MANY_MACRO_LEVELS);
    EXPECT_EQ(tplex::macro_depth, 20);
    std::vector<int> expected;
    for (int i = 0; i < 20; ++i) {
        expected.push_back('m');
        expected.push_back(0);
    }
    expected.push_back(255);
    EXPECT_EQ(reads(41), expected);
}

TEST(CharSource, ALongBodyIsReadToItsEnd) {
    LexSession s;
    const std::string body = std::string(300, 'a') + std::string(2199, 'b');  // 2499
    ASSERT_EQ(push_macro(body.c_str()), 0);
    std::string got;
    for (int c = read_char(); c != 0; c = read_char()) got.push_back(static_cast<char>(c));
    EXPECT_EQ(got, body);
    EXPECT_EQ(read_char(), 255);
}

TEST(CharSource, AnEmptyBodyYieldsOnlyItsZero) {
    LexSession s;
    ASSERT_EQ(push_macro(""), 0);
    EXPECT_EQ(peek_char(), ' ');
    EXPECT_EQ(reads(3), (std::vector<int>{0, 255, 255}));
}

TEST(CharSource, CommentBracketsFold) {
    LexSession s;
    ASSERT_EQ(s.open("/*/ *//x /x */"), 1);
    EXPECT_EQ(nexts(11), (std::vector<int>{251, '/', ' ', 252, '/', 'x', ' ', '/', 'x', ' ', 252}));
    EXPECT_EQ(next_char(), 255);
}

TEST(CharSource, MarkerBytesPassUnchanged) {
    LexSession s;
    ASSERT_EQ(s.open("\xfb\xfc\xfd\xfe\xff" "a"), 1);
    EXPECT_EQ(nexts(7), (std::vector<int>{251, 252, 253, 254, 255, 'a', 255}));
}

TEST(CharSource, BothStacksEmptyReadsTheEndForever) {
    LexSession s;
    EXPECT_EQ(reads(3), (std::vector<int>{255, 255, 255}));
    EXPECT_EQ(peek_char(), ' ');
    ASSERT_EQ(s.open("a"), 1);
    EXPECT_EQ(reads(4), (std::vector<int>{'a', 255, 255, 255}));
    EXPECT_EQ(peek_char(), ' ');
    EXPECT_EQ(tplex::source_depth, 0);
}

TEST(CharSource, LineNumbersAndPositions) {
    LexSession s;
    ASSERT_EQ(s.open("ab\ncd\n"), 1);
    EXPECT_EQ(frame(1).line_no, 0xFFFFFFFFu);
    EXPECT_EQ(reads(2), (std::vector<int>{'a', 'b'}));
    tplex::char_source_store();
    EXPECT_EQ(frame(1).line_no, 0u);
    EXPECT_EQ(frame(1).read_pos, 2);
    EXPECT_STREQ(frame(1).line_text, "ab\n");
    EXPECT_EQ(reads(2), (std::vector<int>{'\n', 'c'}));
    tplex::char_source_store();
    EXPECT_EQ(frame(1).line_no, 1u);
    EXPECT_EQ(frame(1).read_pos, 1);
}

TEST(CharSource, PeekAtTheEndOfALineReadsNoNewLine) {
    LexSession s;
    ASSERT_EQ(s.open("a\nb"), 1);
    EXPECT_EQ(read_char(), 'a');
    EXPECT_EQ(read_char(), '\n');
    EXPECT_EQ(peek_char(), ' ');
    tplex::char_source_store();
    EXPECT_EQ(frame(1).line_no, 0u);
    EXPECT_EQ(read_char(), 'b');
    EXPECT_EQ(peek_char(), ' ');  // last line without a line feed
    EXPECT_EQ(read_char(), 255);
}

TEST(CharSource, LongLinesArriveInPiecesThatCountAsLines) {
    LexSession s;
    const std::string line = std::string(4998, 'a') + "/*" + "\n";
    ASSERT_EQ(s.open(line + "z\n"), 1);
    for (int i = 0; i < 4998; ++i) ASSERT_EQ(next_char(), 'a') << i;
    EXPECT_EQ(peek_char(), '/');
    EXPECT_EQ(next_char(), '/');  // the "*" lies in the next piece
    EXPECT_EQ(peek_char(), ' ');
    tplex::char_source_store();
    EXPECT_EQ(frame(1).line_no, 0u);
    EXPECT_EQ(next_char(), '*');
    tplex::char_source_store();
    EXPECT_EQ(frame(1).line_no, 1u);
    EXPECT_EQ(nexts(3), (std::vector<int>{'\n', 'z', '\n'}));
    tplex::char_source_store();
    EXPECT_EQ(frame(1).line_no, 2u);
}

TEST(CharSource, NulBytesInALine) {
    LexSession s;
    ASSERT_EQ(s.open("ab\0cd\n\0x\nz"s), 1);
    EXPECT_EQ(read_char(), 'a');
    EXPECT_EQ(read_char(), 'b');
    EXPECT_EQ(peek_char(), ' ');
    // The rest of the line is passed over; a line that begins with a NUL
    // gives a 0, and then the next line.
    EXPECT_EQ(reads(4), (std::vector<int>{0, 'z', 255, 255}));
}

TEST(CharSource, AnIncludedFileEndsIntoTheIncludersNextLine) {
    LexSession s;
    const std::string inner = s.file("inner.src", "i");
    ASSERT_EQ(s.open("a b\nc\n"), 1);
    EXPECT_EQ(read_char(), 'a');
    ASSERT_EQ(tplex::open_source_file(inner.c_str()), 2);
    EXPECT_EQ(read_char(), 'i');
    EXPECT_EQ(peek_char(), ' ');
    EXPECT_EQ(tplex::source_depth, 2);
    EXPECT_EQ(reads(3), (std::vector<int>{'c', '\n', 255}));
    EXPECT_EQ(frame(2).file, nullptr);
    EXPECT_EQ(frame(1).file, nullptr);
}

TEST(CharSource, EmptyIncludedFilesAreClosedOneAfterAnother) {
    LexSession s;
    const std::string e1 = s.file("e1.src", "");
    const std::string e2 = s.file("e2.src", "");
    ASSERT_EQ(s.open("a\nb\n"), 1);
    EXPECT_EQ(read_char(), 'a');
    ASSERT_EQ(tplex::open_source_file(e1.c_str()), 2);
    ASSERT_EQ(tplex::open_source_file(e2.c_str()), 3);
    EXPECT_EQ(reads(3), (std::vector<int>{'b', '\n', 255}));
}

}  // namespace
