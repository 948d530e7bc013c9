// The identifier life cycle through parse_ident, generated labels and the
// undeclared check, on real source files.
#include <gtest/gtest.h>

#include <algorithm>
#include <string>
#include <utility>
#include <vector>

#include "dict/declarations.h"
#include "dict/dictionary.h"
#include "lex/lexer.h"
#include "lex/memory.h"
#include "lex_harness.h"
#include "test_support.h"

using tplex::test::CaptureStdout;
using tplex::test::err;
using tplex::test::LexSession;
using tplex::test::Tokens;

namespace {

const token_record &tok() { return tplex::current_token; }

// The entry of a name as "kind:code", or "absent".
std::string entry(std::string name) {
    if (tplex::dict_lookup(name.data()) != 1) return "absent";
    return std::to_string(tok().kind) + ":" + std::to_string(tok().value);
}

// parse_ident's result, then the record's kind and value.
std::string ident(std::uint8_t declare, std::uint8_t class_) {
    const status_code r = parse_ident(declare, class_);
    if (r < 0) return err(r);
    return std::to_string(r) + " " + std::to_string(tok().kind) + ":" + std::to_string(tok().value);
}

// ---------------------------------------------------------------- numbering

TEST(ParseIdent, TheSharedCounterNumbersSixClasses) {
    LexSession s;
    ASSERT_EQ(s.open("a b c d e f g"), 1);
    EXPECT_EQ(ident(1, 13), "0 13:1");
    EXPECT_EQ(ident(1, 19), "0 19:2");
    EXPECT_EQ(ident(1, 14), "0 14:3");
    EXPECT_EQ(ident(1, 15), "0 15:4");
    EXPECT_EQ(ident(1, 16), "0 16:5");
    EXPECT_EQ(ident(1, 26), "0 26:6");
    EXPECT_EQ(ident(1, 13), "0 13:7");
    EXPECT_EQ(entry("A"), "13:1");
    EXPECT_EQ(entry("F"), "26:6");
}

TEST(ParseIdent, TheGeneralCounterStartsWithTwo) {
    LexSession s;
    ASSERT_EQ(s.open("a b c d e f g h i j k l"), 1);
    EXPECT_EQ(ident(1, 17), "0 17:2");
    EXPECT_EQ(ident(1, 27), "0 27:3");
    EXPECT_EQ(ident(1, 13), "0 13:1");  // the shared counter is apart
    int expected = 4;
    for (int c : {18, 20, 21, 22, 23, 24, 25})
        EXPECT_EQ(ident(1, static_cast<std::uint8_t>(c)), "0 " + std::to_string(c) + ":" + std::to_string(expected++));
    EXPECT_EQ(tplex::general_counter, 10);
    // Values outside 13 to 27 count on the general counter too.
    EXPECT_EQ(ident(1, 200), "0 200:11");
    EXPECT_EQ(ident(1, 0), "0 0:12");
}

TEST(ParseIdent, EveryOtherClassUsesTheGeneralCounter) {
    LexSession s;
    ASSERT_EQ(s.open("a b c d e f g h"), 1);
    int expected = 2;
    for (int c : {17, 18, 20, 21, 22, 23, 24, 25})
        EXPECT_EQ(ident(1, static_cast<std::uint8_t>(c)), "0 " + std::to_string(c) + ":" + std::to_string(expected++));
}

TEST(ParseIdent, CountersWrapAndNumbersAreSigned) {
    LexSession s;
    ASSERT_EQ(s.open("a b c d"), 1);
    tplex::general_counter = 32767;
    EXPECT_EQ(ident(1, 17), "0 17:-32768");
    tplex::shared_class_counter = 65535;
    EXPECT_EQ(ident(1, 13), "0 13:0");
    EXPECT_EQ(tplex::next_ident_number(19), 1);
    tplex::general_counter = 65535;
    EXPECT_EQ(tplex::next_ident_number(20), 0);
}

TEST(ParseIdent, NumberingStartsAgainAfterRewind) {
    LexSession s;
    ASSERT_EQ(s.open("a b\n"), 1);
    EXPECT_EQ(ident(1, 13), "0 13:1");
    EXPECT_EQ(ident(1, 20), "0 20:2");
    ASSERT_EQ(rewind_input(), 1);
    EXPECT_EQ(entry("A"), "absent");
    EXPECT_EQ(ident(1, 13), "0 13:1");
    EXPECT_EQ(ident(1, 20), "0 20:2");
}

// ---------------------------------------------------------------- life cycle

TEST(ParseIdent, UsedThenDeclared) {
    LexSession s;
    ASSERT_EQ(s.open("foo foo Foo"), 1);
    EXPECT_EQ(ident(0, 20), "0 12:20");
    EXPECT_EQ(entry("FOO"), "12:20");
    EXPECT_EQ(ident(1, 20), "0 20:2");
    EXPECT_EQ(entry("FOO"), "20:2");
    EXPECT_EQ(ident(0, 20), "0 20:2");
}

TEST(ParseIdent, UsedThenDeclaredWithAnotherClass) {
    LexSession s;
    ASSERT_EQ(s.open("foo foo foo"), 1);
    EXPECT_EQ(ident(0, 20), "0 12:20");
    EXPECT_EQ(ident(1, 21), err(TPLEX_TYPE_MISMATCH));
    EXPECT_EQ(entry("FOO"), "12:20");
    EXPECT_EQ(ident(0, 21), err(TPLEX_TYPE_MISMATCH));
    EXPECT_EQ(tplex::general_counter, 1);  // no number taken
}

TEST(ParseIdent, UsedTwiceWithTheSameClass) {
    LexSession s;
    ASSERT_EQ(s.open("foo foo"), 1);
    EXPECT_EQ(ident(0, 20), "0 12:20");
    EXPECT_EQ(ident(0, 20), "0 12:20");
    CaptureStdout out;
    EXPECT_EQ(dict_check(), TPLEX_UNDECLARED_IDENTIFIER);
    EXPECT_EQ(out.text(), "\nUndeclared Identifier: FOO\nNumber of Undeclared Identifiers = 1");
}

TEST(ParseIdent, DeclaredTwice) {
    LexSession s;
    ASSERT_EQ(s.open("x x x x"), 1);
    EXPECT_EQ(ident(1, 17), "0 17:2");
    EXPECT_EQ(ident(1, 17), err(TPLEX_ALREADY_DECLARED));
    EXPECT_EQ(ident(0, 17), "0 17:2");
    EXPECT_EQ(ident(0, 18), err(TPLEX_TYPE_MISMATCH));
    EXPECT_EQ(entry("X"), "17:2");
}

TEST(ParseIdent, TokensThatAreNoIdentifier) {
    LexSession s;
    ASSERT_EQ(s.open("protocol 12 \"s\" + <\"p\"> 'c'\n"), 1);
    EXPECT_EQ(ident(1, 13), err(TPLEX_IDENTIFIER_EXPECTED));  // reserved word
    EXPECT_EQ(ident(0, 13), err(TPLEX_IDENTIFIER_EXPECTED));  // number
    EXPECT_EQ(ident(1, 13), err(TPLEX_IDENTIFIER_EXPECTED));  // string
    EXPECT_EQ(ident(1, 13), err(TPLEX_IDENTIFIER_EXPECTED));  // operator
    EXPECT_EQ(ident(1, 13), err(TPLEX_ALREADY_DECLARED));     // PDF string: kind 33
    EXPECT_EQ(ident(0, 34), "0 34:" + std::to_string(tok().value));  // character: kind 34
    EXPECT_EQ(ident(1, 13), err(TPLEX_IDENTIFIER_EXPECTED));  // end of input
    EXPECT_EQ(tplex::shared_class_counter, 0);
}

TEST(ParseIdent, ACharacterOrPdfStringAgainstAClass) {
    LexSession s;
    ASSERT_EQ(s.open("'c' <\"p\">"), 1);
    EXPECT_EQ(ident(0, 13), err(TPLEX_TYPE_MISMATCH));
    EXPECT_EQ(ident(0, 33), "0 33:" + std::to_string(tok().value));
}

TEST(ParseIdent, HashDefinitions) {
    LexSession s;
    ASSERT_EQ(s.open("#define D\nD D D"), 1);
    EXPECT_EQ(ident(1, 25), err(TPLEX_ALREADY_DECLARED));
    EXPECT_EQ(ident(0, 25), "0 25:0");
    EXPECT_EQ(ident(0, 20), err(TPLEX_TYPE_MISMATCH));
}

TEST(ParseIdent, ReadingFailuresPassUnchanged) {
    LexSession s;
    ASSERT_EQ(s.open("12ab $ #endif"), 1);
    EXPECT_EQ(ident(1, 13), err(TPLEX_BAD_DIGIT));
    EXPECT_EQ(ident(1, 13), "0 13:1");  // the b left behind
    EXPECT_EQ(ident(1, 13), err(TPLEX_BAD_CHARACTER));
    EXPECT_EQ(ident(1, 13), err(TPLEX_EXTRA_ENDIF));
}

TEST(ParseIdent, DeclarationsSwitchedOff) {
    LexSession s;
    ASSERT_EQ(s.open("foo protocol 5 foo"), 1);
    uint8_t *enabled = nullptr;
    sc_lex_setup(nullptr, nullptr, nullptr, nullptr, &enabled);
    *enabled = 0;
    EXPECT_EQ(parse_ident(1, 13), tk_new_identifier);
    EXPECT_EQ(parse_ident(1, 13), tk_reserved_word);
    EXPECT_EQ(parse_ident(0, 13), tk_number);
    *enabled = 2;  // only 1 switches them on
    EXPECT_EQ(parse_ident(1, 13), tk_new_identifier);
    *enabled = 1;
    EXPECT_EQ(entry("FOO"), "absent");
    EXPECT_EQ(tplex::shared_class_counter, 0);
}

TEST(ParseIdent, AfterBackToken) {
    LexSession s;
    ASSERT_EQ(s.open("foo bar"), 1);
    ASSERT_EQ(sc_next_token(), tk_new_identifier);
    back_token();
    EXPECT_EQ(ident(1, 20), "0 20:2");
    EXPECT_EQ(entry("FOO"), "20:2");
    ASSERT_EQ(sc_next_token(), tk_new_identifier);  // BAR
    back_token();
    EXPECT_EQ(ident(0, 21), "0 12:21");
    EXPECT_EQ(entry("BAR"), "12:21");
}

TEST(ParseIdent, InsideDefineBodies) {
    // After the first token, a declared identifier, one of kind 12 or a
    // name defined without a body is refused; as the first token accepted.
    LexSession s;
    ASSERT_EQ(s.open("dd uu\n#define A 1 dd\n#define B 1 uu\n#define C dd 1\nC"), 1);
    EXPECT_EQ(ident(1, 17), "0 17:2");
    EXPECT_EQ(ident(0, 17), "0 12:17");
    EXPECT_EQ(sc_next_token(), TPLEX_MACRO_BAD_TOKEN);
    EXPECT_EQ(sc_next_token(), TPLEX_MACRO_BAD_TOKEN);
    EXPECT_EQ(ident(0, 17), "0 17:2");  // C's body: DD 1
    EXPECT_EQ(sc_next_token(), tk_number);
    EXPECT_EQ(sc_next_token(), tk_end_of_input);
}

TEST(ParseIdent, ExtendAfterADeclaration) {
    LexSession s;
    ASSERT_EQ(s.open("foo foo"), 1);
    EXPECT_EQ(ident(1, 20), "0 20:2");
    ASSERT_EQ(dict_extend("one", "two", "three", 1, 2, 3), 0);
    EXPECT_EQ(tok().has_definition, 0);
    EXPECT_EQ(ident(0, 20), "0 20:2");
    EXPECT_EQ(tok().has_definition, 1);
    EXPECT_STREQ(tok().def_text1, "one");
    EXPECT_STREQ(tok().def_text2, "two");
    EXPECT_STREQ(tok().def_text3, "three");
    EXPECT_EQ(tok().def_flag1, 1);
    EXPECT_EQ(tok().def_flag2, 2);
    EXPECT_EQ(tok().def_flag3, 3);
}

// ---------------------------------------------------------------- labels

TEST(MakeLabel, DeclareAndCheck) {
    LexSession s;
    EXPECT_EQ(tplex::make_label(42, 7, 1), 0);
    EXPECT_EQ(entry("$lab-00042"), "16:7");
    EXPECT_EQ(tplex::make_label(42, 9, 1), TPLEX_DISASTER);
    EXPECT_EQ(entry("$LAB-00042"), "16:7");
    tplex::current_token.value = 0;
    EXPECT_EQ(tplex::make_label(42, 0, 0), 0);
    EXPECT_EQ(tok().value, 7);
    EXPECT_EQ(tplex::make_label(43, 0, 0), TPLEX_DISASTER);
    EXPECT_EQ(tplex::make_label(43, 0, 2), TPLEX_DISASTER);
    EXPECT_EQ(entry("$LAB-00043"), "absent");
}

TEST(MakeLabel, NamesAndCodes) {
    LexSession s;
    EXPECT_EQ(tplex::make_label(1, 7, 1), 0);
    EXPECT_STREQ(tok().text, "$LAB-00001");
    EXPECT_EQ(tok().slot, 780);
    EXPECT_EQ(tplex::make_label(65535, -1, 1), 0);
    EXPECT_EQ(entry("$LAB-65535"), "16:-1");
    EXPECT_EQ(tplex::make_label(0, 0, 1), 0);
    EXPECT_EQ(entry("$LAB-00000"), "16:0");
    EXPECT_EQ(tplex::shared_class_counter, 0);  // labels take no number
}

TEST(MakeLabel, ALabelIsNotAnIdentifierOfTheSource) {
    LexSession s;
    ASSERT_EQ(s.open("$lab-00042"), 1);
    EXPECT_EQ(tplex::make_label(42, 7, 1), 0);
    EXPECT_EQ(sc_next_token(), TPLEX_BAD_CHARACTER);
}

// ---------------------------------------------------------------- dict_check

TEST(DictCheck, NothingUndeclaredPrintsNothing) {
    LexSession s;
    ASSERT_EQ(s.open("a b"), 1);
    EXPECT_EQ(ident(1, 20), "0 20:2");
    CaptureStdout out;
    EXPECT_EQ(dict_check(), 0);
    EXPECT_EQ(out.text(), "");
}

TEST(DictCheck, ListsInSlotOrder) {
    LexSession s;
    ASSERT_EQ(s.open("zeta alpha mid declared later"), 1);
    std::vector<std::pair<int, std::string>> undeclared;
    for (int i = 0; i < 3; ++i) {
        ASSERT_EQ(parse_ident(0, 20), 0);
        undeclared.emplace_back(tok().slot, tok().text);
    }
    ASSERT_EQ(parse_ident(1, 20), 0);
    ASSERT_EQ(parse_ident(0, 21), 0);
    undeclared.emplace_back(tok().slot, tok().text);
    std::sort(undeclared.begin(), undeclared.end());
    std::string expected;
    for (const auto &u : undeclared) expected += "\nUndeclared Identifier: " + u.second;
    expected += "\nNumber of Undeclared Identifiers = 4";
    CaptureStdout out;
    EXPECT_EQ(dict_check(), TPLEX_UNDECLARED_IDENTIFIER);
    EXPECT_EQ(out.text(), expected);
    // It changes nothing: the same again.
    CaptureStdout again;
    EXPECT_EQ(dict_check(), TPLEX_UNDECLARED_IDENTIFIER);
    EXPECT_EQ(again.text(), expected);
}

TEST(DictCheck, SlotOrderIsNotInsertionOrder) {
    // ZZ hashes to a lower slot than B: (Z-A)*64 = 1600 for Z..., so pick
    // names by their slots.
    LexSession s;
    ASSERT_EQ(s.open("b a"), 1);
    ASSERT_EQ(parse_ident(0, 20), 0);
    const int slot_b = tok().slot;
    ASSERT_EQ(parse_ident(0, 20), 0);
    const int slot_a = tok().slot;
    ASSERT_LT(slot_a, slot_b);
    CaptureStdout out;
    EXPECT_EQ(dict_check(), TPLEX_UNDECLARED_IDENTIFIER);
    EXPECT_EQ(out.text(), "\nUndeclared Identifier: A\nUndeclared Identifier: B\nNumber of Undeclared Identifiers = 2");
}


// ---------------------------------------------------------------- limits

// Fills every free slot with names of kind 10 ("Fn"), keeping the names
// in the source text apart.
void fill_dictionary() {
    int filled = 0;
    for (int s = 0; s < 1664; ++s) filled += tplex::dict_slots[s] != nullptr;
    for (int i = 0; filled < 1664; ++i) {
        std::string name = "F" + std::to_string(i);
        if (tplex::dict_lookup(name.data()) == 0) {
            ASSERT_EQ(tplex::dict_insert(tk_new_identifier, 0, name.c_str()), 0);
            ++filled;
        }
    }
}

TEST(ParseIdent, AFullDictionaryOverwritesNothing) {
    LexSession s;
    ASSERT_EQ(s.open("newname protocol newname"), 1);
    fill_dictionary();
    const std::uint16_t stale = tok().slot;
    const std::string owner = tplex::dict_slots[stale]->name;
    // The scanner's lookup fails: a new identifier, its slot the stale one.
    EXPECT_EQ(ident(1, 13), err(TPLEX_DISASTER));
    EXPECT_EQ(tok().slot, stale);
    EXPECT_EQ(tplex::dict_slots[stale]->name, owner);
    EXPECT_EQ(tplex::shared_class_counter, 1);  // the number was taken
    EXPECT_EQ(ident(1, 13), err(TPLEX_IDENTIFIER_EXPECTED));  // keywords are still found
    EXPECT_EQ(ident(0, 13), err(TPLEX_DISASTER));
    EXPECT_EQ(tplex::dict_slots[stale]->name, owner);
}

TEST(ParseIdent, AFailedInsertUsesUpItsNumber) {
    LexSession s;
    ASSERT_EQ(s.open("a b c"), 1);
    tplex::mem_fail_at(1);
    EXPECT_EQ(ident(1, 13), err(TPLEX_MALLOC_FAILED));
    tplex::mem_fail_at(0);
    EXPECT_EQ(entry("A"), "absent");
    EXPECT_EQ(ident(1, 19), "0 19:2");
    tplex::mem_fail_at(1);
    EXPECT_EQ(ident(0, 20), err(TPLEX_MALLOC_FAILED));
    tplex::mem_fail_at(0);
    EXPECT_EQ(entry("C"), "absent");
    EXPECT_EQ(tplex::general_counter, 1);  // a use takes no number
}

TEST(ParseIdent, AClassOfZeroHidesTheNameFromTheScanner) {
    // An entry of kind 0 keeps the scan going: the word produces no token.
    LexSession s;
    ASSERT_EQ(s.open("ghost ghost x"), 1);
    EXPECT_EQ(ident(1, 0), "0 0:2");
    EXPECT_EQ(tplex::test::describe(LexSession::next()), "id:X");
}

}  // namespace
