// The symbol dictionary (hashing, probing, a full table, definitions) and
// the identifier life cycle on top of it: parse_ident, labels, dict_check.
#include "dict/dictionary.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cstring>
#include <string>
#include <vector>

#include "base/token.h"
#include "lex_harness.h"
#include "scan/scanner.h"
#include "services/declarations.h"
#include "session/lifecycle.h"

using tplex::test::CaptureStdout;
using tplex::test::describe;
using tplex::test::err;
using tplex::test::LexSession;

namespace tplex {
namespace {

const token_record &tok() {
    return current_token;
}

status_code lookup(std::string name) {
    return dict_lookup(name.data());
}

// The entry of a name as "kind:code", or "absent".
std::string entry(const std::string &name) {
    if (lookup(name) != 1) return "absent";
    return std::to_string(tok().kind) + ":" + std::to_string(tok().value);
}

status_code insert(std::uint8_t kind, std::int16_t code, const std::string &name) {
    EXPECT_EQ(lookup(name), 0) << name;
    return dict_insert(kind, code, name.c_str());
}

// A name whose home slot is the given one.
std::string name_at(int home, const char *prefix = "Q") {
    for (int i = 0;; ++i) {
        std::string n = prefix + std::to_string(i);
        if (dict_hash(n.c_str()) == home) return n;
    }
}

TEST(Dictionary, HashAndKeywordSlots) {
    LexSession s;
    for (const auto &[name, hash] : std::initializer_list<std::pair<const char *, int>>{
             {"A", 0},
             {"AB", 608},
             {"<=", 128},
             {"STATE", 444},
             {"SEQUENCEVALIDITY", 1404},
             {"$LAB-00001", 780},
             {"", 0},
             {"\xFF", static_cast<std::uint16_t>(-66 * 64) % 1664}})
        EXPECT_EQ(dict_hash(name), hash) << name;
    // Keywords that share a home slot probe on to the next.
    for (const auto &[word, slot] : std::initializer_list<std::pair<const char *, int>>{
             {"ALL", 208}, {"TIME", 209}, {"include", 210}, {"Protocol", 1208}, {"UINT", 1209}}) {
        EXPECT_EQ(lookup(word), 1) << word;
        EXPECT_EQ(tok().slot, slot) << word;
    }
    EXPECT_STREQ(tok().text, "UINT");
    EXPECT_EQ(tok().kind, tk_reserved_word);
}

TEST(Dictionary, AMissTouchesOnlySlotAndDefinitionFlag) {
    LexSession s;
    current_token.kind = 77;
    current_token.has_definition = 1;
    std::strcpy(current_token.text, "BEFORE");
    EXPECT_EQ(lookup("newname"), 0);
    EXPECT_EQ(tok().kind, 77);
    EXPECT_STREQ(tok().text, "BEFORE");
    EXPECT_EQ(tok().has_definition, 0);
    const std::uint16_t free_slot = tok().slot;
    EXPECT_EQ(dict_insert(20, -1, "NEWNAME"), 0);
    EXPECT_EQ(lookup("NewName"), 1);
    EXPECT_EQ(tok().slot, free_slot);
    EXPECT_EQ(tok().value, -1);  // codes are sign-extended
}

TEST(Dictionary, ProbeWrapsAndAFullTableOverwritesNothing) {
    LexSession s;
    dict_clear();
    EXPECT_EQ(insert(20, 1, name_at(1663)), 0);
    EXPECT_EQ(insert(20, 2, name_at(1663, "R")), 0);
    EXPECT_EQ(tok().slot, 0);
    EXPECT_EQ(entry(name_at(1663, "R")), "20:2");
    for (int i = 0; i < 1662; ++i) ASSERT_EQ(insert(20, 1, "N" + std::to_string(i)), 0);
    for (int home : {0, 1, 831, 1663}) {
        current_token.slot = 4321 % 1664;
        EXPECT_EQ(lookup(name_at(home, "S")), TPLEX_DISASTER) << home;
        EXPECT_EQ(tok().slot, 4321 % 1664) << "slot left as it was";
    }
    EXPECT_EQ(lookup("NEWCOMER"), TPLEX_DISASTER);
    const dict_entry *held = dict_slots[tok().slot];
    EXPECT_EQ(dict_insert(21, 9, "NEWCOMER"), TPLEX_DISASTER);
    EXPECT_EQ(dict_slots[tok().slot], held);
    EXPECT_EQ(entry("N0"), "20:1");
    EXPECT_EQ(entry("N1661"), "20:1");
}

TEST(Dictionary, DefinitionsAndLongNames) {
    LexSession s;
    EXPECT_EQ(insert(20, 1, "FIELDNAME"), 0);
    EXPECT_EQ(dict_extend(std::string(4000, 'x').c_str(), "two", "three", 4, 5, 6), 0);
    EXPECT_EQ(tok().has_definition, 0) << "not before the next lookup";
    EXPECT_EQ(lookup("fieldname"), 1);
    EXPECT_EQ(tok().has_definition, 1);
    EXPECT_EQ(std::strlen(tok().def_text1), 2499u);
    EXPECT_STREQ(tok().def_text3, "three");
    EXPECT_EQ(tok().def_flag1 * 100 + tok().def_flag2 * 10 + tok().def_flag3, 456);
    // Extending from the record's own texts replaces the definition.
    EXPECT_EQ(dict_extend(tok().def_text2, tok().def_text3, nullptr, 0, 0, 0), 0);
    EXPECT_EQ(lookup("FIELDNAME"), 1);
    EXPECT_STREQ(tok().def_text1, "two");
    EXPECT_STREQ(tok().def_text3, "");
    // Inserting over a found name keeps the entry and drops its definition.
    const dict_entry *e = dict_slots[tok().slot];
    EXPECT_EQ(dict_insert(21, 7, "FIELDNAME"), 0);
    EXPECT_EQ(dict_slots[tok().slot], e);
    EXPECT_EQ(e->definition, nullptr);
    EXPECT_EQ(lookup("NOSUCHNAME"), 0);
    EXPECT_EQ(dict_extend("a", "b", "c", 0, 0, 0), TPLEX_DISASTER);
    // A name counts as its first 128 characters.
    EXPECT_EQ(insert(25, 2, std::string(128, 'K') + "TAIL"), 0);
    EXPECT_EQ(entry(std::string(128, 'k') + "OTHER"), "25:2");
}

// The scanner keeps the outcome of its recent lookups of short words: every
// change of the table must reach it.
TEST(Dictionary, ScannedWordsSeeEveryChangeOfTheTable) {
    LexSession s;
    ASSERT_EQ(s.open("w w w w w state"), 1);
    EXPECT_EQ(describe(LexSession::next()), "id:W");
    ASSERT_EQ(insert(20, 5, "W"), 0);
    EXPECT_EQ(describe(LexSession::next()), "k20:5:W");
    ASSERT_EQ(lookup("W"), 1);
    dict_discard();
    EXPECT_EQ(describe(LexSession::next()), "id:W");
    ASSERT_EQ(insert(21, 6, "W"), 0);
    dict_set_kind(22, 7);
    EXPECT_EQ(describe(LexSession::next()), "k22:7:W");
    dict_clear();
    EXPECT_EQ(describe(LexSession::next()), "id:W");
    EXPECT_EQ(describe(LexSession::next()), "id:STATE");  // the keywords went with the rest
}

// parse_ident's result, then the record's kind and value.
std::string ident(std::uint8_t declare, std::uint8_t class_) {
    const status_code r = parse_ident(declare, class_);
    if (r < 0) return err(r);
    return std::to_string(r) + " " + std::to_string(tok().kind) + ":" + std::to_string(tok().value);
}

TEST(ParseIdent, TwoCountersNumberTheClasses) {
    LexSession s;
    ASSERT_EQ(s.open("a b c d e f g h i j k l m n o p q r s"), 1);
    int n = 1;  // the shared counter, from 1
    for (int c : {13, 19, 14, 15, 16, 26})
        EXPECT_EQ(ident(1, static_cast<std::uint8_t>(c)),
                  "0 " + std::to_string(c) + ":" + std::to_string(n++));
    n = 2;  // every other class on the general counter, from 2
    for (int c : {17, 27, 18, 20, 21, 22, 23, 24, 25, 200, 0})
        EXPECT_EQ(ident(1, static_cast<std::uint8_t>(c)),
                  "0 " + std::to_string(c) + ":" + std::to_string(n++));
    general_counter = 32767;
    EXPECT_EQ(ident(1, 17), "0 17:-32768");
    shared_class_counter = 65535;
    EXPECT_EQ(ident(1, 13), "0 13:0");
    ASSERT_EQ(rewind_input(), 1);  // numbering starts again
    EXPECT_EQ(ident(1, 13), "0 13:1");
    EXPECT_EQ(ident(1, 20), "0 20:2");
}

TEST(ParseIdent, UsesDeclarationsAndMismatches) {
    LexSession s;
    ASSERT_EQ(s.open("foo foo Foo foo foo bar bar bar foo"), 1);
    EXPECT_EQ(ident(0, 20), "0 12:20");  // used first: kind 12, the class as value
    EXPECT_EQ(ident(1, 21), err(TPLEX_TYPE_MISMATCH));
    EXPECT_EQ(ident(1, 20), "0 20:2");
    EXPECT_EQ(ident(0, 20), "0 20:2");
    EXPECT_EQ(ident(1, 20), err(TPLEX_ALREADY_DECLARED));
    EXPECT_EQ(ident(0, 21), "0 12:21");
    EXPECT_EQ(ident(0, 21), "0 12:21");
    EXPECT_EQ(ident(0, 22), err(TPLEX_TYPE_MISMATCH));
    EXPECT_EQ(ident(0, 21), err(TPLEX_TYPE_MISMATCH));
    EXPECT_EQ(general_counter, 2);  // uses take no number
}

TEST(ParseIdent, TokensThatAreNoIdentifier) {
    LexSession s;
    ASSERT_EQ(s.open("protocol 12 \"s\" + $ <\"p\"> 'c' 'd' #define D\nD D"), 1);
    for (int i = 0; i < 4; ++i) EXPECT_EQ(ident(1, 13), err(TPLEX_IDENTIFIER_EXPECTED)) << i;
    EXPECT_EQ(ident(1, 13), err(TPLEX_BAD_CHARACTER));     // reading failures pass unchanged
    EXPECT_EQ(ident(1, 13), err(TPLEX_ALREADY_DECLARED));  // a PDF string: kind 33
    EXPECT_EQ(ident(0, 13), err(TPLEX_TYPE_MISMATCH));     // a character: kind 34
    EXPECT_EQ(ident(0, 34).substr(0, 5), "0 34:");
    EXPECT_EQ(ident(1, 25), err(TPLEX_ALREADY_DECLARED));
    EXPECT_EQ(ident(0, 25), "0 25:0");
    EXPECT_EQ(ident(1, 13), err(TPLEX_IDENTIFIER_EXPECTED));  // end of input
    EXPECT_EQ(shared_class_counter, 0);
}

TEST(ParseIdent, SwitchedOffOnlyReads) {
    LexSession s;
    ASSERT_EQ(s.open("foo protocol foo ghost ghost x"), 1);
    uint8_t *enabled = nullptr;
    sc_lex_setup(nullptr, nullptr, nullptr, nullptr, &enabled);
    *enabled = 0;
    EXPECT_EQ(parse_ident(1, 13), tk_new_identifier);
    *enabled = 2;  // only 1 switches them on
    EXPECT_EQ(parse_ident(1, 13), tk_reserved_word);
    *enabled = 1;
    EXPECT_EQ(entry("FOO"), "absent");
    // After back_token the identifier is declared all the same.
    ASSERT_EQ(sc_next_token(), tk_new_identifier);
    back_token();
    EXPECT_EQ(ident(1, 20), "0 20:2");
    // An entry of kind 0 makes the scanner pass over the word.
    EXPECT_EQ(ident(1, 0), "0 0:3");
    EXPECT_EQ(describe(LexSession::next()), "id:X");
}

TEST(MakeLabel, DeclareAndCheck) {
    LexSession s;
    EXPECT_EQ(make_label(42, 7, 1), 0);
    EXPECT_EQ(entry("$lab-00042"), "16:7");
    EXPECT_EQ(make_label(42, 9, 1), TPLEX_DISASTER);
    current_token.value = 0;
    EXPECT_EQ(make_label(42, 0, 0), 0);
    EXPECT_EQ(tok().value, 7);
    EXPECT_EQ(make_label(43, 0, 2), TPLEX_DISASTER);
    EXPECT_EQ(make_label(65535, -1, 1), 0);
    EXPECT_EQ(entry("$LAB-65535"), "16:-1");
    EXPECT_EQ(make_label(0, 0, 1), 0);
    EXPECT_EQ(entry("$LAB-00000"), "16:0");
    EXPECT_EQ(shared_class_counter + general_counter, 1);  // labels take no number
}

TEST(DictCheck, ListsUndeclaredNamesInSlotOrder) {
    LexSession s;
    ASSERT_EQ(s.open("zeta alpha b a mid declared later"), 1);
    std::vector<std::pair<int, std::string>> undeclared;
    for (int i = 0; i < 5; ++i) {
        ASSERT_EQ(parse_ident(0, 20), 0);
        undeclared.emplace_back(tok().slot, tok().text);
    }
    ASSERT_EQ(parse_ident(1, 20), 0);
    std::sort(undeclared.begin(), undeclared.end());
    std::string expected;
    for (const auto &u : undeclared) expected += "\nUndeclared Identifier: " + u.second;
    expected += "\nNumber of Undeclared Identifiers = 5";
    for (int again = 0; again < 2; ++again) {  // it changes nothing
        CaptureStdout out;
        EXPECT_EQ(dict_check(), TPLEX_UNDECLARED_IDENTIFIER);
        EXPECT_EQ(out.text(), expected);
    }
    ASSERT_EQ(rewind_input(), 1);
    CaptureStdout out;
    EXPECT_EQ(dict_check(), 0);
    EXPECT_EQ(out.text(), "");
}

}  // namespace
}  // namespace tplex
