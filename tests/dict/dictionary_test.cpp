// The symbol dictionary: hashing, probing, a full table, definitions, and
// the listing with its key-press pauses fed from a file on standard input.
#include "dict/dictionary.h"

#include <gtest/gtest.h>
#include <unistd.h>

#include <cstdio>
#include <cstring>
#include <string>

#include "base/token.h"
#include "test_support.h"
#include "tplex/services.h"

namespace tplex {
namespace {

using test::LexSession;

const token_record &tok = current_token;

status_code lookup(std::string name) {
    return dict_lookup(name.data());
}

// The entry of a name as "kind:code", or "absent".
std::string entry(const std::string &name) {
    if (lookup(name) != 1) return "absent";
    return std::to_string(tok.kind) + ":" + std::to_string(tok.value);
}

status_code insert(std::uint8_t kind, std::int16_t code, const std::string &name) {
    EXPECT_EQ(lookup(name), 0) << name;
    return dict_insert(kind, code, name.c_str());
}

// A name whose home slot is the given one ("" if none is found).
std::string name_at(int home, const char *prefix = "Q") {
    for (int i = 0; i < 5000000; ++i)
        if (dict_hash((prefix + std::to_string(i)).c_str()) == home)
            return prefix + std::to_string(i);
    return "";
}

TEST(Dictionary, HashAndKeywordSlots) {
    LexSession s;
    const std::pair<const char *, int> hashes[] = {
        {"A", 0},
        {"AB", 608},
        {"<=", 128},
        {"STATE", 444},
        {"SEQUENCEVALIDITY", 1404},
        {"$LAB-00001", 780},
        {"", 0},
        {"\xFF", static_cast<std::uint16_t>(-66 * 64) % 1664}};
    for (const auto &[name, hash] : hashes) EXPECT_EQ(dict_hash(name), hash) << name;
    // Keywords that share a home slot probe on to the next.
    const std::pair<const char *, int> slots[] = {
        {"ALL", 208}, {"TIME", 209}, {"include", 210}, {"Protocol", 1208}, {"UINT", 1209}};
    for (const auto &[word, slot] : slots) {
        EXPECT_EQ(lookup(word), 1) << word;
        EXPECT_EQ(tok.slot, slot) << word;
    }
    EXPECT_STREQ(tok.text, "UINT");
}

TEST(Dictionary, ProbeWrapsAndAFullTableOverwritesNothing) {
    LexSession s;
    dict_clear();
    EXPECT_EQ(insert(20, 1, name_at(1663)), 0);
    EXPECT_EQ(insert(20, 2, name_at(1663, "R")), 0);
    EXPECT_EQ(tok.slot, 0);
    EXPECT_EQ(entry(name_at(1663, "R")), "20:2");
    for (int i = 0; i < 1662; ++i) ASSERT_EQ(insert(20, 1, "N" + std::to_string(i)), 0);
    for (int home : {0, 831, 1663}) {
        current_token.slot = 99;
        EXPECT_EQ(lookup(name_at(home, "S")), TPLEX_DISASTER) << home;
        EXPECT_EQ(tok.slot, 99) << "slot left as it was";
    }
    EXPECT_EQ(dict_insert(21, 9, "NEWCOMER"), TPLEX_DISASTER);
    EXPECT_EQ(entry("N0") + entry("N1661"), "20:120:1");
}

// A miss touches only the slot and the definition flag; codes are sign-extended.
TEST(Dictionary, DefinitionsAndLongNames) {
    LexSession s;
    current_token.kind = 77;
    current_token.has_definition = 1;
    EXPECT_EQ(lookup("fieldname"), 0);
    EXPECT_EQ(tok.kind * 10 + tok.has_definition, 770);
    EXPECT_EQ(dict_insert(20, -1, "FIELDNAME"), 0);
    EXPECT_EQ(entry("FieldName"), "20:-1");
    EXPECT_EQ(dict_extend(std::string(4000, 'x').c_str(), "two", "three", 4, 5, 6), 0);
    EXPECT_EQ(tok.has_definition, 0) << "not before the next lookup";
    EXPECT_EQ(lookup("fieldname"), 1);
    EXPECT_EQ(std::strlen(tok.def_text1), 2499u);
    EXPECT_STREQ(tok.def_text3, "three");
    EXPECT_EQ(tok.def_flag1 * 100 + tok.def_flag2 * 10 + tok.def_flag3, 456);
    // Extending from the record's own texts replaces the definition.
    EXPECT_EQ(dict_extend(tok.def_text2, tok.def_text3, nullptr, 0, 0, 0), 0);
    EXPECT_EQ(lookup("FIELDNAME"), 1);
    EXPECT_EQ(std::string(tok.def_text1) + "|" + tok.def_text3, "two|");
    // Inserting over a found name keeps the entry and drops its definition.
    EXPECT_EQ(dict_insert(21, 7, "FIELDNAME"), 0);
    EXPECT_EQ(lookup("FIELDNAME") * 10 + tok.has_definition, 10);
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
    const std::string fresh = test::next();
    ASSERT_EQ(insert(20, 5, "W"), 0);
    const std::string declared = test::next();
    EXPECT_NE(declared, fresh);
    ASSERT_EQ(lookup("W"), 1);
    dict_discard();
    EXPECT_EQ(test::next(), fresh);
    ASSERT_EQ(insert(21, 6, "W"), 0);
    dict_set_kind(22, 7);
    EXPECT_NE(test::next(), declared);
    dict_clear();
    EXPECT_EQ(test::next(), fresh);
    EXPECT_NE(test::next().find("STATE"), std::string::npos);
    EXPECT_EQ(tok.kind, tk_new_identifier);  // the keywords went with the rest
}

// dict_list with standard input read from the given bytes; what it printed.
std::string listing(std::uint8_t all, const std::string &keys, int *next_key = nullptr) {
    test::TempDir dir;
    const int saved = dup(0);
    EXPECT_NE(std::freopen(dir.write("keys", keys).c_str(), "rb", stdin), nullptr);
    test::Capture out;
    dict_list(all);
    const std::string text = out.text();
    if (next_key != nullptr) *next_key = std::getchar();
    dup2(saved, 0), close(saved), std::clearerr(stdin);
    return text;
}

// A line per entry in slot order, "Press a key" after the 9th, 19th...; with
// all = 0 no reserved words (C) and hash words (F).
TEST(Listing, EntriesInSlotOrderWithPauses) {
    LexSession s;
    EXPECT_EQ(listing(0, ""), "\n End of Listing \n");
    dict_clear();
    int slot = 0;
    for (int kind : {2, 4, 9, 10, 12, 24, 25, 33, 34, 16})  // A, B, C... at slots 0, 64, 128...
        ASSERT_EQ(insert(std::uint8_t(kind), 0, std::string(1, char('A' + slot++))), 0);
    const std::string a_b = "\n   0   String            A\n  64   Unknown           B",
                      d_e = "\n 192   Identifier        D\n 256   Unknown           E",
                      g_i =
                          "\n 384   Hash Definition   G\n 448   PDF String        H"
                          "\n 512   Char              I",
                      j = "\n 576   Unknown           J", end = "\n End of Listing \n";
    EXPECT_EQ(listing(0, ""), a_b + d_e + g_i + j + end);
    int next_key = 0;
    EXPECT_EQ(listing(1, std::string("\0\0xyz", 5), &next_key),
              a_b + "\n 128   Reserved Word     C" + d_e + "\n 320   Hash Word         F" + g_i +
                  "\n  Press a key" + j + end);
    EXPECT_EQ(next_key, 'y') << "a pause waits for a character that is not NUL";
}

}  // namespace
}  // namespace tplex
