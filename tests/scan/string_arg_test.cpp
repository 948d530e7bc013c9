// parse_string in its three modes.
#include <gtest/gtest.h>

#include <cstring>
#include <string>

#include "lex_harness.h"
#include "scan/string_arg.h"

using tplex::parse_string;
using tplex::test::describe;
using tplex::test::LexSession;
using tplex::test::Tokens;

namespace {

struct Out {
    char buf[2500];
    Out() { std::strcpy(buf, "untouched"); }
    std::string str() const { return buf; }
};

TEST(ParseString, OptionalFacingAnIdentifier) {
    LexSession s;
    ASSERT_EQ(s.open("abc x"), 1);
    Out out;
    EXPECT_EQ(parse_string(out.buf, 1), 0);
    EXPECT_EQ(out.str(), "");
    EXPECT_EQ(LexSession::all_described(), (Tokens{"id:ABC", "id:X", "eof"}));
}

TEST(ParseString, OptionalFacingAString) {
    LexSession s;
    ASSERT_EQ(s.open("\"a b\" x"), 1);
    Out out;
    EXPECT_EQ(parse_string(out.buf, 1), 0);
    EXPECT_EQ(out.str(), "a b");
    EXPECT_EQ(LexSession::all_described(), (Tokens{"id:X", "eof"}));
}

TEST(ParseString, NotAllowedFacingAString) {
    LexSession s;
    ASSERT_EQ(s.open("\"a\" x"), 1);
    Out out;
    EXPECT_EQ(parse_string(out.buf, 0), TPLEX_STRING_NOT_ALLOWED);
    EXPECT_EQ(out.str(), "untouched");
    EXPECT_EQ(LexSession::all_described(), (Tokens{"id:X", "eof"}));
}

TEST(ParseString, NotAllowedFacingSomethingElse) {
    LexSession s;
    ASSERT_EQ(s.open("12 x"), 1);
    Out out;
    EXPECT_EQ(parse_string(out.buf, 0), 0);
    EXPECT_EQ(out.str(), "");
    EXPECT_EQ(LexSession::all_described(), (Tokens{"n:12:12", "id:X", "eof"}));
}

TEST(ParseString, RequiredFacingTheEndOfInput) {
    LexSession s;
    ASSERT_EQ(s.open(""), 1);
    Out out;
    EXPECT_EQ(parse_string(out.buf, 2), TPLEX_STRING_EXPECTED);
    EXPECT_EQ(out.str(), "untouched");
}

TEST(ParseString, RequiredFacingSomethingElseConsumesIt) {
    LexSession s;
    ASSERT_EQ(s.open("<\"pdf\"> x"), 1);
    Out out;
    EXPECT_EQ(parse_string(out.buf, 2), TPLEX_STRING_EXPECTED);
    EXPECT_EQ(out.str(), "untouched");
    EXPECT_EQ(LexSession::all_described(), (Tokens{"id:X", "eof"}));
}

TEST(ParseString, RequiredInAnyOtherMode) {
    LexSession s;
    ASSERT_EQ(s.open("\"a\" \"b\" 'c'"), 1);
    Out out;
    EXPECT_EQ(parse_string(out.buf, 2), 0);
    EXPECT_EQ(out.str(), "a");
    EXPECT_EQ(parse_string(out.buf, 255), 0);
    EXPECT_EQ(out.str(), "b");
    EXPECT_EQ(parse_string(out.buf, 7), TPLEX_STRING_EXPECTED);
    EXPECT_EQ(out.str(), "b");
}

TEST(ParseString, EmptyStrings) {
    LexSession s;
    ASSERT_EQ(s.open("\"\" \"\""), 1);
    Out out;
    EXPECT_EQ(parse_string(out.buf, 1), 0);
    EXPECT_EQ(out.str(), "");
    std::strcpy(out.buf, "x");
    EXPECT_EQ(parse_string(out.buf, 2), 0);
    EXPECT_EQ(out.str(), "");
}

TEST(ParseString, APdfStringCountsAsSomethingElse) {
    LexSession s;
    ASSERT_EQ(s.open("<\"p\">"), 1);
    Out out;
    EXPECT_EQ(parse_string(out.buf, 1), 0);
    EXPECT_EQ(out.str(), "");
    EXPECT_EQ(LexSession::all_described(), (Tokens{"pdf:p", "eof"}));
}

TEST(ParseString, ReaderFailuresPassThrough) {
    LexSession s;
    ASSERT_EQ(s.open("12ab \"s"), 1);
    Out out;
    EXPECT_EQ(parse_string(out.buf, 1), TPLEX_BAD_DIGIT);
    EXPECT_EQ(out.str(), "untouched");
    EXPECT_EQ(parse_string(out.buf, 0), 0);  // the B left behind, given back
    EXPECT_EQ(describe(LexSession::next()), "id:B");
    EXPECT_EQ(parse_string(out.buf, 2), TPLEX_END_OF_LINE_IN_STRING);
    EXPECT_EQ(out.str(), "");
}

TEST(ParseString, ThroughTheFilter) {
    LexSession s;
    ASSERT_EQ(s.open("#define S \"defined\"\n#ifdef NO\n\"skipped\"\n#endif\nS"), 1);
    Out out;
    EXPECT_EQ(parse_string(out.buf, 2), 0);
    EXPECT_EQ(out.str(), "defined");
}

TEST(ParseString, A2499CharacterString) {
    LexSession s;
    const std::string text(2499, 'q');
    ASSERT_EQ(s.open("\"" + text + "zz\""), 1);
    Out out;
    EXPECT_EQ(parse_string(out.buf, 1), 0);
    EXPECT_EQ(out.str(), text);
}

}  // namespace
