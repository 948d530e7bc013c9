// The symbol dictionary: hashing, probing, the full table, the record a
// lookup leaves, and the operations that act on the slot it left.
#include <gtest/gtest.h>

#include <cstring>
#include <string>
#include <vector>

#include "dict/dictionary.h"
#include "lex/lexer.h"

namespace tplex {
namespace {

class Dictionary : public ::testing::Test {
protected:
    void SetUp() override { ASSERT_EQ(lex_initialise(), 0); }
    void TearDown() override { lex_free(); }

    status_code lookup(std::string name) {
        buffer_ = name;
        return dict_lookup(buffer_.data());
    }
    status_code insert(std::uint8_t kind, std::int16_t code, const std::string &name) {
        EXPECT_EQ(lookup(name), 0) << name;
        return dict_insert(kind, code, name.c_str());
    }
    std::string buffer_;
};

// An empty table with hash weights, for probing from chosen home slots.
class EmptyDictionary : public Dictionary {
protected:
    void SetUp() override {
        Dictionary::SetUp();
        dict_clear();
    }
    // A name whose home slot is the given one: "Q" and digits, searched.
    static std::string name_at(int home) {
        for (int i = 0;; ++i) {
            std::string n = "Q" + std::to_string(i);
            if (dict_hash(n.c_str()) == home) return n;
        }
    }
};

TEST_F(Dictionary, HashWorkedValues) {
    EXPECT_EQ(dict_hash("A"), 0);
    EXPECT_EQ(dict_hash("AB"), 608);
    EXPECT_EQ(dict_hash("<="), 128);
    EXPECT_EQ(dict_hash("STATE"), 444);
    EXPECT_EQ(dict_hash("PROTOCOL"), 1208);
    EXPECT_EQ(dict_hash("DEFINE"), 252);
    EXPECT_EQ(dict_hash("INCLUDE"), 209);
    EXPECT_EQ(dict_hash("SEQUENCEVALIDITY"), 1404);
    EXPECT_EQ(dict_hash("$LAB-00001"), 780);
}

TEST_F(Dictionary, HashCountsBytesAsSignedAndWrapsAt16Bits) {
    // (0xFF as -1) - 65 = -66, times 64, modulo 65536, modulo 1664.
    EXPECT_EQ(dict_hash("\xFF"), static_cast<std::uint16_t>(-66 * 64) % 1664);
    EXPECT_EQ(hash_weights[7], 64);
    EXPECT_EQ(hash_weights[13], 1);
    EXPECT_EQ(hash_weights[127], 32);
}

TEST_F(Dictionary, LookupFoldsCaseInPlaceAndFillsTheRecord) {
    char name[] = "protocol";
    EXPECT_EQ(dict_lookup(name), 1);
    EXPECT_STREQ(name, "PROTOCOL");
    EXPECT_STREQ(current_token.text, "PROTOCOL");
    EXPECT_EQ(current_token.kind, tk_reserved_word);
    EXPECT_EQ(current_token.value, 0);
    EXPECT_EQ(current_token.has_definition, 0);
    EXPECT_EQ(current_token.slot, 1208);
    EXPECT_EQ(lookup("Protocol"), 1);
    EXPECT_EQ(current_token.slot, 1208);
}

TEST_F(Dictionary, KeywordCollisionsProbeToTheNextSlot) {
    struct Case { const char *word; int slot; };
    for (Case c : {Case{"ALL", 208}, Case{"TIME", 209}, Case{"INCLUDE", 210},
                   Case{"PROTOCOL", 1208}, Case{"UINT", 1209}}) {
        EXPECT_EQ(lookup(c.word), 1) << c.word;
        EXPECT_EQ(current_token.slot, c.slot) << c.word;
    }
}

TEST_F(Dictionary, MissLeavesTheFreeSlotAndOnlyTouchesSlotAndDefinitionFlag) {
    current_token.kind = 77;
    current_token.value = 1234;
    current_token.has_definition = 1;
    std::strcpy(current_token.text, "BEFORE");
    EXPECT_EQ(lookup("NEWNAME"), 0);
    EXPECT_EQ(current_token.kind, 77);
    EXPECT_EQ(current_token.value, 1234);
    EXPECT_STREQ(current_token.text, "BEFORE");
    EXPECT_EQ(current_token.has_definition, 0);
    const std::uint16_t free_slot = current_token.slot;
    EXPECT_EQ(dict_slots[free_slot], nullptr);
    EXPECT_EQ(dict_insert(20, 5, "NEWNAME"), 0);
    EXPECT_EQ(lookup("newname"), 1);
    EXPECT_EQ(current_token.slot, free_slot);
    EXPECT_EQ(current_token.kind, 20);
    EXPECT_EQ(current_token.value, 5);
}

TEST_F(Dictionary, CodesAreSignExtended) {
    EXPECT_EQ(insert(20, -1, "MINUS"), 0);
    EXPECT_EQ(static_cast<std::uint32_t>(current_token.value), 0xFFFFFFFFu);
    EXPECT_EQ(insert(20, static_cast<std::int16_t>(40000), "BIG"), 0);
    EXPECT_EQ(lookup("BIG"), 1);
    EXPECT_EQ(current_token.value, -25536);
}

TEST_F(EmptyDictionary, ProbeWrapsFromTheLastSlotToSlotZero) {
    const std::string a = name_at(1663);
    std::string other;
    for (int i = 0;; ++i) {  // a second name with home 1663
        other = "R" + std::to_string(i);
        if (dict_hash(other.c_str()) == 1663) break;
    }
    EXPECT_EQ(insert(20, 1, a), 0);
    EXPECT_EQ(current_token.slot, 1663);
    EXPECT_EQ(insert(20, 2, other), 0);
    EXPECT_EQ(current_token.slot, 0);
    EXPECT_EQ(lookup(other), 1);
    EXPECT_EQ(current_token.value, 2);
}

TEST_F(EmptyDictionary, FullTableRefusesANewNameFromEveryHomeSlot) {
    for (int i = 0; i < dict_slot_count; ++i) ASSERT_EQ(insert(20, 1, "N" + std::to_string(i)), 0);
    for (int home : {0, 1, 831, 1662, 1663}) {
        current_token.slot = 4321 % 1664;
        current_token.has_definition = 1;
        EXPECT_EQ(lookup(name_at(home)), TPLEX_DISASTER) << home;
        EXPECT_EQ(current_token.slot, 4321 % 1664) << "slot left as it was";
        EXPECT_EQ(current_token.has_definition, 0);
    }
    // Every name still present is found from its own home slot.
    EXPECT_EQ(lookup("N0"), 1);
    EXPECT_EQ(lookup("N1663"), 1);
}

TEST_F(EmptyDictionary, InsertAfterAFullTableNeverOverwritesAnotherName) {
    for (int i = 0; i < dict_slot_count; ++i) ASSERT_EQ(insert(20, 1, "N" + std::to_string(i)), 0);
    EXPECT_EQ(lookup("NEWCOMER"), TPLEX_DISASTER);
    const dict_entry *held = dict_slots[current_token.slot];
    EXPECT_EQ(dict_insert(21, 9, "NEWCOMER"), TPLEX_DISASTER);
    EXPECT_EQ(dict_slots[current_token.slot], held);
    EXPECT_EQ(held->kind, 20);
    EXPECT_NE(std::string(held->name), "NEWCOMER");
}

TEST_F(Dictionary, InsertOverAFoundNameReusesTheEntryAndDropsItsDefinition) {
    EXPECT_EQ(insert(20, 1, "REUSED"), 0);
    ASSERT_EQ(dict_extend("a", "b", "c", 1, 2, 3), 0);
    const dict_entry *e = dict_slots[current_token.slot];
    EXPECT_EQ(lookup("REUSED"), 1);
    EXPECT_EQ(dict_insert(21, 7, "REUSED"), 0);
    EXPECT_EQ(dict_slots[current_token.slot], e);
    EXPECT_EQ(e->kind, 21);
    EXPECT_EQ(e->code, 7);
    EXPECT_EQ(e->definition, nullptr);
}

TEST_F(Dictionary, SetKindChangesKindAndCodeOnly) {
    EXPECT_EQ(insert(tk_undeclared, 20, "LATER"), 0);
    std::strcpy(current_token.text, "UNCHANGED");
    dict_set_kind(20, 3);
    EXPECT_EQ(current_token.kind, 20);
    EXPECT_EQ(current_token.value, 3);
    EXPECT_STREQ(current_token.text, "UNCHANGED");
    EXPECT_EQ(lookup("LATER"), 1);
    EXPECT_EQ(current_token.kind, 20);
}

TEST_F(Dictionary, ExtendShowsOnTheNextLookup) {
    EXPECT_EQ(insert(20, 1, "FIELDNAME"), 0);
    EXPECT_EQ(dict_extend("one", "two", "three", 4, 5, 6), 0);
    EXPECT_EQ(current_token.has_definition, 0) << "not before the next lookup";
    EXPECT_EQ(lookup("fieldname"), 1);
    EXPECT_EQ(current_token.has_definition, 1);
    EXPECT_STREQ(current_token.def_text1, "one");
    EXPECT_STREQ(current_token.def_text2, "two");
    EXPECT_STREQ(current_token.def_text3, "three");
    EXPECT_EQ(current_token.def_flag1, 4);
    EXPECT_EQ(current_token.def_flag2, 5);
    EXPECT_EQ(current_token.def_flag3, 6);
    // Extending again from the record's own texts replaces the definition.
    EXPECT_EQ(dict_extend(current_token.def_text2, current_token.def_text1, nullptr, 0, 0, 0), 0);
    EXPECT_EQ(lookup("FIELDNAME"), 1);
    EXPECT_STREQ(current_token.def_text1, "two");
    EXPECT_STREQ(current_token.def_text2, "one");
    EXPECT_STREQ(current_token.def_text3, "");
}

TEST_F(Dictionary, ExtendCutsLongTextsAndRefusesAnEmptySlot) {
    EXPECT_EQ(insert(20, 1, "LONGDEF"), 0);
    const std::string long_text(4000, 'x');
    EXPECT_EQ(dict_extend(long_text.c_str(), "", "", 0, 0, 0), 0);
    EXPECT_EQ(lookup("LONGDEF"), 1);
    EXPECT_EQ(std::strlen(current_token.def_text1), 2499u);

    EXPECT_EQ(lookup("NOSUCHNAME"), 0);
    EXPECT_EQ(dict_extend("a", "b", "c", 0, 0, 0), TPLEX_DISASTER);
    EXPECT_EQ(lookup("NOSUCHNAME"), 0) << "nothing was created";
    current_token.slot = 60000;  // a slot number out of range
    EXPECT_EQ(dict_extend("a", "b", "c", 0, 0, 0), TPLEX_DISASTER);
}

TEST_F(Dictionary, NamesLongerThan128CountAsTheirFirst128) {
    const std::string first(128, 'K');
    EXPECT_EQ(insert(25, 2, first + "TAIL"), 0);
    EXPECT_STREQ(current_token.text, first.c_str());
    EXPECT_EQ(lookup(first + "OTHER"), 1);
    EXPECT_EQ(lookup(first), 1);
    EXPECT_EQ(current_token.kind, 25);
}

TEST_F(Dictionary, TheEmptyNameIsANameLikeAnyOther) {
    EXPECT_EQ(dict_hash(""), 0);
    EXPECT_EQ(insert(25, 2, ""), 0);
    EXPECT_EQ(lookup(""), 1);
    EXPECT_EQ(current_token.kind, 25);
    EXPECT_EQ(lookup("A"), 0) << "A shares the home slot but not the name";
}

TEST(DictionaryBeforeInit, OperationsRefuseWithoutState) {
    lex_free();
    char name[] = "x";
    EXPECT_EQ(dict_lookup(name), 0);
    EXPECT_EQ(dict_insert(20, 1, "X"), TPLEX_NOT_INITIALISED);
    EXPECT_EQ(dict_extend("a", "b", "c", 0, 0, 0), TPLEX_NOT_INITIALISED);
    dict_set_kind(20, 1);  // nothing to change, nothing to crash
}

}  // namespace
}  // namespace tplex
