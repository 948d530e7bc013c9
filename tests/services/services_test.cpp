// The parser services: identifiers and their numbers, labels, the check for
// undeclared names, string arguments and file names.
#include <gtest/gtest.h>

#include <cstring>
#include <string>
#include <tuple>

#include "base/token.h"
#include "dict/dictionary.h"
#include "services/declarations.h"
#include "services/file_names.h"
#include "services/string_arg.h"
#include "test_support.h"

namespace tplex {
namespace {

using test::err;
using test::LexSession;
using test::rest;

// parse_ident's result, then the record's kind and value.
std::string ident(std::uint8_t declare, std::uint8_t class_) {
    const status_code r = parse_ident(declare, class_);
    if (r < 0) return err(r);
    return std::to_string(r) + " " + std::to_string(current_token.kind) + ":" +
           std::to_string(current_token.value);
}

// Declares the next identifiers of the input in the given classes: "kind:number ...".
std::string declare_all(std::initializer_list<int> classes) {
    std::string out;
    for (int c : classes) out += ident(1, static_cast<std::uint8_t>(c)).substr(2) + " ";
    return out;
}

TEST(ParseIdent, TwoCountersNumberTheClasses) {
    LexSession s;
    ASSERT_EQ(s.open("a b c d e f g h i j k l m n o p q r s t u v"), 1);
    EXPECT_EQ(declare_all({13, 19, 14, 15, 16, 26}), "13:1 19:2 14:3 15:4 16:5 26:6 ");
    EXPECT_EQ(declare_all({17, 27, 18, 20, 21, 25, 200, 0}),
              "17:2 27:3 18:4 20:5 21:6 25:7 200:8 0:9 ");
    general_counter = 32767;
    shared_class_counter = 65535;
    EXPECT_EQ(declare_all({17, 13}), "17:-32768 13:0 ");
    ASSERT_EQ(rewind_input(), 1);  // numbering starts again
    EXPECT_EQ(declare_all({13, 20}), "13:1 20:2 ");
}

TEST(ParseIdent, UsesDeclarationsAndMismatches) {
    LexSession s;
    ASSERT_EQ(s.open("foo foo Foo foo foo bar bar bar foo"), 1);
    const std::string mismatch = err(TPLEX_TYPE_MISMATCH);
    EXPECT_EQ(ident(0, 20), "0 12:20");  // used first: kind 12, the class as value
    EXPECT_EQ(ident(1, 21), mismatch);
    EXPECT_EQ(ident(1, 20), "0 20:2");
    EXPECT_EQ(ident(0, 20), "0 20:2");
    EXPECT_EQ(ident(1, 20), err(TPLEX_ALREADY_DECLARED));
    EXPECT_EQ(ident(0, 21), "0 12:21");
    EXPECT_EQ(ident(0, 21), "0 12:21");
    EXPECT_EQ(ident(0, 22), mismatch);
    EXPECT_EQ(ident(0, 21), mismatch);
    EXPECT_EQ(general_counter, 2);  // uses take no number
}

// Reading failures pass unchanged; other tokens are no identifier, or mismatch
// (a character), or stand declared (a PDF string, a name of kind 25). With
// declarations switched off (only 1 is on) parse_ident only reads.
TEST(ParseIdent, TokensThatAreNoIdentifier) {
    LexSession s;
    ASSERT_EQ(s.open("12 $ <\"p\"> 'c' #define D\nD D foo foo x"), 1);
    const std::tuple<int, int, std::string> cases[] = {
        // declare, class, result
        {1, 13, err(TPLEX_IDENTIFIER_EXPECTED)}, {1, 13, err(TPLEX_BAD_CHARACTER)},
        {1, 13, err(TPLEX_ALREADY_DECLARED)},    {0, 13, err(TPLEX_TYPE_MISMATCH)},
        {1, 25, err(TPLEX_ALREADY_DECLARED)},    {0, 25, "0 25:0"}};
    for (const auto &[declare, class_, result] : cases)
        EXPECT_EQ(ident(std::uint8_t(declare), std::uint8_t(class_)), result);
    uint8_t *enabled = nullptr;
    sc_lex_setup(nullptr, nullptr, nullptr, nullptr, &enabled);
    *enabled = 2;
    EXPECT_EQ(parse_ident(1, 13), tk_new_identifier);
    *enabled = 1;
    EXPECT_EQ(ident(1, 20), "0 20:2");
    EXPECT_EQ(rest(), "id:X eof");
}

TEST(MakeLabel, DeclareAndCheck) {
    LexSession s;
    EXPECT_EQ(make_label(42, 7, 1), 0);
    EXPECT_EQ(make_label(42, 9, 1), TPLEX_DISASTER);
    current_token.value = 0;
    EXPECT_EQ(make_label(42, 0, 0), 0);
    EXPECT_EQ(current_token.value, 7);
    EXPECT_EQ(make_label(43, 0, 2), TPLEX_DISASTER);
    EXPECT_EQ(make_label(65535, -1, 1), 0);
    std::string name = "$lab-65535";
    EXPECT_EQ(dict_lookup(name.data()) * 100 + current_token.kind, 116);
    EXPECT_EQ(shared_class_counter + general_counter, 1);  // labels take no number
}

TEST(DictCheck, ListsUndeclaredNamesInSlotOrder) {
    LexSession s;
    ASSERT_EQ(s.open("zeta b declared zeta"), 1);  // B's slot is below ZETA's
    for (int declare : {0, 0, 1, 0})
        ASSERT_EQ(parse_ident(static_cast<std::uint8_t>(declare), 20), 0);
    test::Capture undeclared;
    EXPECT_EQ(dict_check(), TPLEX_UNDECLARED_IDENTIFIER);
    EXPECT_EQ(undeclared.text(),
              "\nUndeclared Identifier: B\nUndeclared Identifier: ZETA\n"
              "Number of Undeclared Identifiers = 2");
    ASSERT_EQ(rewind_input(), 1);
    test::Capture out;
    EXPECT_EQ(dict_check(), 0);
    EXPECT_EQ(out.text(), "");
}

// parse_string in a mode: "result|output|the tokens after".
std::string parse(const std::string &text, std::uint8_t mode) {
    LexSession s;
    if (s.open(text) != 1) return "open failed";
    char out[2500] = "untouched";
    const status_code r = parse_string(out, mode);
    return (r < 0 ? err(r) : std::to_string(r)) + "|" + out + "| " + rest();
}

TEST(ParseString, Modes) {
    const std::string expected = err(TPLEX_STRING_EXPECTED);
    EXPECT_EQ(parse("abc x", 1), "0|| id:ABC id:X eof");  // optional: anything else is given back
    EXPECT_EQ(parse("\"a b\" x", 1), "0|a b| id:X eof");
    EXPECT_EQ(parse("12 x", 0), "0|| n:12:12 id:X eof");  // not allowed
    EXPECT_EQ(parse("\"a\" x", 0), err(TPLEX_STRING_NOT_ALLOWED) + "|untouched| id:X eof");
    EXPECT_EQ(parse("\"a\" x", 255), "0|a| id:X eof");  // required: anything else is consumed
    EXPECT_EQ(parse("<\"p\"> x", 2), expected + "|untouched| id:X eof");
    EXPECT_EQ(parse("", 2), expected + "|untouched| eof");
    EXPECT_EQ(parse("12ab x", 1), err(TPLEX_BAD_DIGIT) + "|untouched| id:B id:X eof");
    EXPECT_EQ(parse("#define S \"def\"\n#ifdef NO\n\"skipped\"\n#endif\nS", 2), "0|def| eof");
}

// Splits a path with the expected extension: "dir|name|ext|the path after".
std::string split(std::string path, const char *ext) {
    file_spec out;
    std::memset(&out, 'Z', sizeof out);
    split_file_spec(path.data(), ext, &out);
    return std::string(out.dir_part) + "|" + out.name_part + "|" + out.ext_part + "|" +
           path.c_str();
}

TEST(FileNameParts, Split) {
    // clang-format off
    const char *table[][3] = {
        {"a\\b\\c.x", "x", "a\\b|c|x|c.x"}, {"a\\b\\c.x", "y", "a\\b|c.x||c.x"}, {"F.X", "x", "|F.X||F.X"},
        {"c", "x", "|c||c"}, {"a.b.c", "c", "|a.b|c|a.b.c"}, {"c.", "", "|c||c."},
        {"a/b\\c", "", "a/b|c||c"}, {"d\\$", "x", "d|$||$"},
        {"$", "0123456789abcdefghij", "|$|0123456789abcde|$"}};
    // clang-format on
    for (auto [path, ext, parts] : table) EXPECT_EQ(split(path, ext), parts) << path;
    EXPECT_EQ(split(std::string(300, 'd') + "\\n.x", "x"), std::string(199, 'd') + "|n|x|n.x");
}

// file_spec_invalid of dir, name and ext; a default name replaces only "$".
TEST(FileNameParts, DefaultNameAndValidity) {
    file_spec parts{};
    split_file_spec(std::string("d\\$").data(), "x", &parts);
    EXPECT_EQ(file_spec_invalid(&parts), 1);
    apply_default_name(&parts, "main");
    apply_default_name(&parts, "other");
    EXPECT_STREQ(parts.name_part, "main");
    EXPECT_EQ(file_spec_invalid(&parts), 0);
    const std::string d100(100, 'd'), n40(40, 'n'), e10(10, 'e');
    // clang-format off
    const std::string table[][4] = {  // dir, name, ext, invalid
        {"", "", "", "0"}, {"d", "", "", "1"}, {"a#b\\c/d~-:._ ", "n/a~-:_. 9Z", "e/~-:_. ", "0"},
        {"", "a#b", "", "1"}, {"", "n", "e#", "1"}, {"d$", "n", "", "1"}, {"", "caf\xC3\xA9", "", "1"},
        {d100, n40, e10, "0"}, {d100 + "d", "n", "", "1"}, {"", n40 + "n", "", "1"}, {"", "n", e10 + "e", "1"}};
    // clang-format on
    for (const auto &[dir, name, ext, invalid] : table) {
        parts = file_spec{};
        dir.copy(parts.dir_part, 199), name.copy(parts.name_part, 79), ext.copy(parts.ext_part, 15);
        EXPECT_EQ(file_spec_invalid(&parts), invalid[0] - '0') << dir << "|" << name << "|" << ext;
    }
}

}  // namespace
}  // namespace tplex
