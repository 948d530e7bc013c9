// The parser services: identifiers, labels, the undeclared check, string arguments, file names.
#include "tplex/services.h"

#include <gtest/gtest.h>

#include <cstring>
#include <string>
#include <tuple>

#include "dict/dictionary.h"
#include "services/declarations.h"
#include "test_support.h"

namespace tplex::test {
namespace {

// parse_ident's result, then the record's kind and value.
std::string ident(std::uint8_t declare, std::uint8_t class_) {
    const status_code r = parse_ident(declare, class_);
    if (r < 0) return err(r);
    return std::to_string(r) + " " + std::to_string(current_token.kind) + ":" +
           std::to_string(current_token.value);
}

TEST(ParseIdent, TwoCountersNumberTheClasses) {
    LexSession s;
    auto declare_all = [](std::initializer_list<int> classes) {  // "kind:number ..."
        std::string out;
        for (int c : classes) out += ident(1, std::uint8_t(c)).substr(2) + " ";
        return out;
    };
    ASSERT_EQ(s.open("a b c d e f g h i j k l m n o p q r s t u v"), 1);
    EXPECT_EQ(declare_all({13, 19, 14, 15, 16, 26}), "13:1 19:2 14:3 15:4 16:5 26:6 ");
    EXPECT_EQ(declare_all({17, 27, 18, 20, 21, 25, 200, 0}),
              "17:2 27:3 18:4 20:5 21:6 25:7 200:8 0:9 ");
    general_counter = 32767, shared_class_counter = 65535;
    EXPECT_EQ(declare_all({17, 13}), "17:-32768 13:0 ");
    ASSERT_EQ(rewind_input(), 1);  // numbering starts again
    EXPECT_EQ(declare_all({13, 20}), "13:1 20:2 ");
}

// A name used first is kind 12 with the class as value and takes no number. Reading failures
// pass unchanged; other tokens are no identifier, or mismatch (a character), or stand declared
// (a PDF string, a name of kind 25). Switched off (only 1 is on), parse_ident only reads.
TEST(ParseIdent, UsesDeclarationsAndOtherTokens) {
    LexSession s;
    ASSERT_EQ(s.open("foo foo Foo foo foo bar bar bar foo 12 $ <\"p\"> 'c' #define D\nD D x x"), 1);
    const std::string mismatch = err(TPLEX_TYPE_MISMATCH), again = err(TPLEX_ALREADY_DECLARED);
    // clang-format off
    const std::tuple<int, int, std::string> calls[] = {  // declare, class, result
        {0, 20, "0 12:20"}, {1, 21, mismatch}, {1, 20, "0 20:2"}, {0, 20, "0 20:2"}, {1, 20, again},
        {0, 21, "0 12:21"}, {0, 21, "0 12:21"}, {0, 22, mismatch}, {0, 21, mismatch},
        {1, 13, err(TPLEX_IDENTIFIER_EXPECTED)}, {1, 13, err(TPLEX_BAD_CHARACTER)},
        {1, 13, again}, {0, 13, mismatch}, {1, 25, again}, {0, 25, "0 25:0"}};
    // clang-format on
    for (const auto &[declare, class_, result] : calls)
        EXPECT_EQ(ident(std::uint8_t(declare), std::uint8_t(class_)), result);
    declare_enabled = 2;
    EXPECT_EQ(parse_ident(1, 13), tk_new_identifier);
    declare_enabled = 1;
    EXPECT_EQ(ident(1, 20), "0 20:3");
}

TEST(MakeLabel, DeclareAndCheck) {
    LexSession s;
    EXPECT_EQ(make_label(42, 7, 1), 0);
    EXPECT_EQ(make_label(42, 9, 1), TPLEX_DISASTER);
    current_token.value = 0;  // a check gives the label's code
    EXPECT_EQ(make_label(42, 0, 0) == 0 ? current_token.value : -1, 7);
    EXPECT_EQ(make_label(43, 0, 2), TPLEX_DISASTER);
    EXPECT_EQ(make_label(65535, -1, 1), 0);
    char name[] = "$lab-65535";
    EXPECT_EQ(dict_lookup(name) == 1 ? current_token.kind : -1, tk_label);
    EXPECT_EQ(shared_class_counter + general_counter, 1);  // labels take no number
}

// Undeclared names in slot order (B's is below ZETA's); a fresh pass has none and prints nothing.
TEST(DictCheck, ListsUndeclaredNamesInSlotOrder) {
    LexSession s;
    ASSERT_EQ(s.open("zeta b declared zeta"), 1);
    for (int declare : {0, 0, 1, 0}) ASSERT_EQ(parse_ident(std::uint8_t(declare), 20), 0);
    Capture out;
    EXPECT_EQ(dict_check(), TPLEX_UNDECLARED_IDENTIFIER);
    ASSERT_EQ(rewind_input(), 1);
    EXPECT_EQ(dict_check(), 0);
    EXPECT_EQ(out.text(),
              "\nUndeclared Identifier: B\nUndeclared Identifier: ZETA\n"
              "Number of Undeclared Identifiers = 2");
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
    EXPECT_EQ(parse("abc x", 1), "0|| id:ABC id:X eof");  // optional: anything else is given back
    EXPECT_EQ(parse("\"a b\" x", 1), "0|a b| id:X eof");
    EXPECT_EQ(parse("12 x", 0), "0|| n:12:12 id:X eof");  // not allowed
    EXPECT_EQ(parse("\"a\" x", 0), err(TPLEX_STRING_NOT_ALLOWED) + "|untouched| id:X eof");
    EXPECT_EQ(parse("\"a\" x", 255), "0|a| id:X eof");  // required: anything else is consumed
    EXPECT_EQ(parse("<\"p\"> x", 2), err(TPLEX_STRING_EXPECTED) + "|untouched| id:X eof");
    EXPECT_EQ(parse("12ab x", 1), err(TPLEX_BAD_DIGIT) + "|untouched| id:B id:X eof");
}

// Splits a path, then applies a default name (it replaces only "$"): "dir|name|ext|path after".
std::string split(std::string path, const char *ext, const char *default_name = nullptr) {
    file_spec out;
    std::memset(&out, 'Z', sizeof out);
    split_file_spec(path.data(), ext, &out);
    if (default_name != nullptr) apply_default_name(&out, default_name);
    return std::string(out.dir_part) + "|" + out.name_part + "|" + out.ext_part + "|" +
           path.c_str();
}

TEST(FileNameParts, SplitDefaultNameAndValidity) {
    // clang-format off
    const char *table[][3] = {
        {"a\\b\\c.x", "x", "a\\b|c|x|c.x"}, {"a\\b\\c.x", "y", "a\\b|c.x||c.x"},
        {"F.X", "x", "|F.X||F.X"}, {"c", "x", "|c||c"}, {"a.b.c", "c", "|a.b|c|a.b.c"},
        {"c.", "", "|c||c."}, {"a/b\\c", "", "a/b|c||c"}, {"d\\$", "x", "d|$||$"},
        {"$", "0123456789abcdefghij", "|$|0123456789abcde|$"}};
    for (auto [path, ext, parts] : table) EXPECT_EQ(split(path, ext), parts) << path;
    EXPECT_EQ(split(std::string(300, 'd') + "\\n.x", "x"), std::string(199, 'd') + "|n|x|n.x");
    EXPECT_EQ(split("d\\$", "x", "main") + split("d\\c", "x", "main"), "d|main||$d|c||c");
    // file_spec_invalid of dir, name and ext.
    const std::string d100(100, 'd'), n40(40, 'n'), e10(10, 'e');
    const std::string fields[][4] = {  // dir, name, ext, invalid
        {"", "", "", "0"}, {"d", "", "", "1"}, {"a#b\\c/d~-:._ ", "n/a~-:_. 9Z", "e/~-:_. ", "0"},
        {"", "a#b", "", "1"}, {"", "n", "e#", "1"}, {"d$", "n", "", "1"}, {"", "$", "", "1"},
        {"", "caf\xC3\xA9", "", "1"}, {d100, n40, e10, "0"}, {d100 + "d", "n", "", "1"},
        {"", n40 + "n", "", "1"}, {"", "n", e10 + "e", "1"}};
    // clang-format on
    for (const auto &[dir, name, ext, invalid] : fields) {
        file_spec parts{};
        dir.copy(parts.dir_part, 199), name.copy(parts.name_part, 79), ext.copy(parts.ext_part, 15);
        EXPECT_EQ(file_spec_invalid(&parts), invalid[0] - '0') << dir << "|" << name << "|" << ext;
    }
}

}  // namespace
}  // namespace tplex::test
