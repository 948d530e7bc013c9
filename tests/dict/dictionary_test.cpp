// The symbol dictionary: hashing, probing, a full table, definitions and the paused listing.
#include "dict/dictionary.h"

#include <gtest/gtest.h>
#include <unistd.h>

#include <cstdio>
#include <string>

#include "test_support.h"
#include "tplex/services.h"

namespace tplex {
namespace {

const token_record &tok = current_token;

const auto lookup = [](std::string name) { return dict_lookup(name.data()); };

// The entry of a name as "kind:code", then " text1|text2|text3|flags" if it has a definition.
std::string entry(const std::string &name) {
    if (lookup(name) != 1) return "absent";
    const std::string e = std::to_string(tok.kind) + ":" + std::to_string(tok.value);
    if (tok.has_definition == 0) return e;
    return e + " " + tok.def_text1 + "|" + tok.def_text2 + "|" + tok.def_text3 + "|" +
           std::to_string(tok.def_flag1 * 100 + tok.def_flag2 * 10 + tok.def_flag3);
}

status_code insert(std::uint8_t kind, std::int16_t code, const std::string &name) {
    EXPECT_EQ(lookup(name), 0) << name;
    return dict_insert(kind, code, name.c_str());
}

// The first name of the form prefix + number whose home slot is the given one.
std::string name_at(int home, const char *prefix = "Q") {
    int i = 0;
    while (dict_hash((prefix + std::to_string(i)).c_str()) != home) ++i;
    return prefix + std::to_string(i);
}

TEST(Dictionary, HashingAndProbing) {
    test::LexSession s;
    // clang-format off
    const std::pair<const char *, int> hashes[] = {{"A", 0}, {"AB", 608}, {"<=", 128},
        {"STATE", 444}, {"SEQUENCEVALIDITY", 1404}, {"$LAB-00001", 780}, {"", 0}, {"\xFF", 1408}};
    // clang-format on
    for (const auto &[name, hash] : hashes) EXPECT_EQ(dict_hash(name), hash) << name;
    // Keywords that share a home slot probe on to the next.
    const std::pair<const char *, int> slots[] = {
        {"ALL", 208}, {"TIME", 209}, {"include", 210}, {"Protocol", 1208}, {"UINT", 1209}};
    for (const auto &[word, slot] : slots) EXPECT_EQ(lookup(word) == 1 ? tok.slot : -1, slot);
    // The probe wraps from the last slot to the first; a full table overwrites nothing.
    dict_clear();
    EXPECT_EQ(insert(20, 1, name_at(1663)), 0);
    EXPECT_EQ(insert(20, 2, name_at(1663, "R")), 0);
    EXPECT_EQ(tok.slot, 0);
    for (int i = 0; i < 1662; ++i) ASSERT_EQ(insert(20, 1, "N" + std::to_string(i)), 0);
    for (int home : {0, 831, 1663}) {
        current_token.slot = 99;  // a failed lookup leaves the slot as it was
        EXPECT_EQ(lookup(name_at(home, "S")) == TPLEX_DISASTER ? tok.slot : -1, 99) << home;
    }
    EXPECT_EQ(dict_insert(21, 9, "NEWCOMER"), TPLEX_DISASTER);
    EXPECT_EQ(entry("N0") + entry("N1661"), "20:120:1");
}

// A miss touches only the slot and the definition flag; codes are sign-extended.
TEST(Dictionary, DefinitionsAndLongNames) {
    test::LexSession s;
    current_token.kind = 77, current_token.has_definition = 1;
    EXPECT_EQ(lookup("fieldname"), 0);
    EXPECT_EQ(tok.kind * 10 + tok.has_definition, 770);
    EXPECT_EQ(dict_insert(20, -1, "FIELDNAME"), 0);
    EXPECT_EQ(dict_extend(std::string(4000, 'x').c_str(), "two", "three", 4, 5, 6), 0);
    EXPECT_EQ(tok.has_definition, 0) << "not before the next lookup";
    EXPECT_EQ(entry("FieldName"), "20:-1 " + std::string(2499, 'x') + "|two|three|456");
    // Extending from the record's own texts replaces the definition.
    EXPECT_EQ(dict_extend(tok.def_text2, tok.def_text3, nullptr, 0, 0, 0), 0);
    EXPECT_EQ(entry("FIELDNAME"), "20:-1 two|three||0");
    // Inserting over a found name keeps the entry and drops its definition.
    EXPECT_EQ(dict_insert(21, 7, "FIELDNAME"), 0);
    EXPECT_EQ(entry("FIELDNAME"), "21:7");
    EXPECT_EQ(lookup("NOSUCHNAME"), 0);
    EXPECT_EQ(dict_extend("a", "b", "c", 0, 0, 0), TPLEX_DISASTER);
    // A name counts as its first 128 characters.
    EXPECT_EQ(insert(25, 2, std::string(128, 'K') + "TAIL"), 0);
    EXPECT_EQ(entry(std::string(128, 'k') + "OTHER"), "25:2");
}

// The scanner keeps its recent lookups of short words: every change of the table must reach it.
TEST(Dictionary, ScannedWordsSeeEveryChangeOfTheTable) {
    test::LexSession s;
    ASSERT_EQ(s.open("w w w w w state"), 1);
    EXPECT_EQ(test::next(), "id:W");
    ASSERT_EQ(insert(20, 5, "W"), 0);
    EXPECT_EQ(test::next(), "k20:5:W");
    ASSERT_EQ(lookup("W"), 1);
    dict_discard();
    EXPECT_EQ(test::next(), "id:W");
    ASSERT_EQ(insert(21, 6, "W"), 0);
    EXPECT_EQ(test::next(), "k21:6:W");
    dict_clear();
    EXPECT_EQ(test::next(), "id:W");
    EXPECT_EQ(test::next(), "id:STATE");  // the keywords went with the rest
}

// dict_list with standard input read from the given bytes: what it printed, "|", the next byte.
std::string listing(std::uint8_t all, const std::string &keys) {
    test::TempDir dir;
    const int saved = dup(0);
    EXPECT_NE(std::freopen(dir.write("keys", keys).c_str(), "rb", stdin), nullptr);
    test::Capture out;
    dict_list(all);
    const std::string text = out.text() + "|" + char(std::getchar());
    dup2(saved, 0), close(saved), std::clearerr(stdin);
    return text;
}

// A line per entry in slot order, a pause after the 9th, 19th... that waits for a byte
// other than NUL; all = 0 hides reserved words and hash words (all the keywords).
TEST(Listing, EntriesInSlotOrderWithPauses) {
    test::LexSession s;
    EXPECT_EQ(listing(0, "k"), "\n End of Listing \n|k");
    dict_clear();
    int slot = 0;
    for (int kind : {2, 4, 9, 10, 12, 24, 25, 33, 34, 16})  // A, B, C... at slots 0, 64, 128...
        ASSERT_EQ(insert(std::uint8_t(kind), 0, std::string(1, char('A' + slot++))), 0);
    EXPECT_EQ(listing(1, std::string("\0\0xyz", 5)),
              "\n   0   String            A\n  64   Unknown           B"
              "\n 128   Reserved Word     C\n 192   Identifier        D"
              "\n 256   Unknown           E\n 320   Hash Word         F"
              "\n 384   Hash Definition   G\n 448   PDF String        H"
              "\n 512   Char              I\n  Press a key"
              "\n 576   Unknown           J\n End of Listing \n|y");
}

}  // namespace
}  // namespace tplex
