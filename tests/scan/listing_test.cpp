// The dictionary listing, byte for byte, with its key-press pauses fed from
// a file on standard input.
#include <gtest/gtest.h>

#include <cstdio>
#include <string>

#include <unistd.h>

#include "dict/dictionary.h"
#include "lex/lexer.h"
#include "lex_harness.h"
#include "scan/listing.h"
#include "test_support.h"

using tplex::test::CaptureStdout;
using tplex::test::LexSession;
using tplex::test::TempDir;

namespace {

// Standard input reads from a file with the given bytes for the object's
// lifetime; the earlier standard input comes back afterwards.
class StdinFrom {
public:
    explicit StdinFrom(const std::string &bytes) {
        path_ = dir_.write("stdin", bytes);
        saved_ = dup(0);
        if (std::freopen(path_.c_str(), "r", stdin) == nullptr) ADD_FAILURE() << "freopen";
    }
    ~StdinFrom() {
        dup2(saved_, 0);
        close(saved_);
        std::clearerr(stdin);
    }
    // What is left unread.
    static std::string rest() {
        std::string out;
        for (int c = std::getchar(); c != EOF; c = std::getchar()) out.push_back(static_cast<char>(c));
        return out;
    }

private:
    TempDir dir_;
    std::string path_;
    int saved_ = -1;
};

const char *name_of(int kind) {
    switch (kind) {
        case 2: return "String";
        case 9: return "Reserved Word";
        case 10: return "Identifier";
        case 24: return "Hash Word";
        case 25: return "Hash Definition";
        case 33: return "PDF String";
        case 34: return "Char";
        default: return "Unknown";
    }
}

// What the listing should print for the dictionary as it stands, and how
// many pauses it makes.
std::string expected_listing(bool all, int *pauses) {
    std::string out;
    int line = 1;
    *pauses = 0;
    for (int s = 0; s < 1664; ++s) {
        const tplex::dict_entry *e = tplex::dict_slots[s];
        if (e == nullptr) continue;
        if (!all && (e->kind == 9 || e->kind == 24)) continue;
        ++line;
        char buf[300];
        std::snprintf(buf, sizeof buf, "\n%4d   %-15s   %s", s, name_of(e->kind), e->name);
        out += buf;
        if (line % 10 == 0) {
            out += "\n  Press a key";
            ++*pauses;
        }
    }
    return out + "\n End of Listing \n";
}

std::string listing(std::uint8_t all, const std::string &keys = "") {
    StdinFrom in(keys);
    CaptureStdout out;
    tplex::dict_list(all);
    return out.text();
}

// Defines n names with sc_lex_init_defines: N0, N1, ...
void define_names(int n) {
    for (int i = 0; i < n; ++i) {
        std::string name = "N" + std::to_string(i);
        char *p = name.data();
        ASSERT_EQ(sc_lex_init_defines(&p, 1), 0);
    }
}

TEST(Listing, AnEmptyDictionary) {
    LexSession s;
    tplex::dict_clear();
    EXPECT_EQ(listing(1), "\n End of Listing \n");
    EXPECT_EQ(listing(0), "\n End of Listing \n");
}

TEST(Listing, OnlyKeywordsAndArgumentZero) {
    LexSession s;
    EXPECT_EQ(listing(0), "\n End of Listing \n");
}

TEST(Listing, EveryKeyword) {
    LexSession s;
    int pauses = 0;
    const std::string expected = expected_listing(true, &pauses);
    EXPECT_EQ(pauses, 12);  // 123 lines: after the 9th, 19th, ..., 119th
    EXPECT_EQ(listing(1, std::string(12, 'k')), expected);
    // The first lines, spelled out.
    EXPECT_EQ(expected.substr(0, 37), "\n  10   Reserved Word     EVENTSTATUS");
}

TEST(Listing, NineEntriesPauseOnceAfterTheNinth) {
    LexSession s;
    define_names(9);
    int pauses = 0;
    const std::string expected = expected_listing(false, &pauses);
    EXPECT_EQ(pauses, 1);
    const std::string got = listing(0, "xy");
    EXPECT_EQ(got, expected);
    EXPECT_EQ(got.size() - got.rfind("\n  Press a key"), std::string("\n  Press a key\n End of Listing \n").size());
}

TEST(Listing, NineteenPauseTwiceEightNever) {
    {
        LexSession s;
        define_names(19);
        int pauses = 0;
        const std::string expected = expected_listing(false, &pauses);
        EXPECT_EQ(pauses, 2);
        EXPECT_EQ(listing(0, "ab"), expected);
    }
    {
        LexSession s;
        define_names(8);
        int pauses = 0;
        const std::string expected = expected_listing(false, &pauses);
        EXPECT_EQ(pauses, 0);
        EXPECT_EQ(expected.find("Press"), std::string::npos);
        EXPECT_EQ(listing(0), expected);
    }
}

TEST(Listing, APauseWaitsForACharacterThatIsNotNul) {
    LexSession s;
    define_names(9);
    StdinFrom in(std::string("\0\0xyz", 5));
    {
        CaptureStdout out;
        tplex::dict_list(0);
    }
    EXPECT_EQ(StdinFrom::rest(), "yz");
}

TEST(Listing, TheEndOfInputEndsAWait) {
    LexSession s;
    define_names(29);
    int pauses = 0;
    const std::string expected = expected_listing(false, &pauses);
    EXPECT_EQ(pauses, 3);
    EXPECT_EQ(listing(0, ""), expected);
    EXPECT_EQ(listing(0, std::string(3, '\0')), expected);
}

TEST(Listing, KindNamesAndTheirField) {
    LexSession s;
    ASSERT_EQ(s.open("abc abc"), 1);
    ASSERT_EQ(parse_ident(1, 20), 0);  // declared: Unknown
    char d[] = "DEF";
    char *names[] = {d};
    ASSERT_EQ(sc_lex_init_defines(names, 1), 0);
    const int def_slot = tplex::current_token.slot;
    CaptureStdout out;
    tplex::dict_list(0);
    const std::string text = out.text();
    char line[100];
    std::snprintf(line, sizeof line, "\n%4d   Hash Definition   DEF", def_slot);
    EXPECT_NE(text.find(line), std::string::npos) << text;
    EXPECT_NE(text.find("   Unknown           ABC"), std::string::npos) << text;
}

TEST(Listing, KindNameTable) {
    EXPECT_STREQ(tplex::kind_name(2), "String");
    EXPECT_STREQ(tplex::kind_name(9), "Reserved Word");
    EXPECT_STREQ(tplex::kind_name(10), "Identifier");
    EXPECT_STREQ(tplex::kind_name(24), "Hash Word");
    EXPECT_STREQ(tplex::kind_name(25), "Hash Definition");
    EXPECT_STREQ(tplex::kind_name(33), "PDF String");
    EXPECT_STREQ(tplex::kind_name(34), "Char");
    for (int k : {0, 1, 3, 4, 5, 12, 13, 16, 27, 36, 255}) EXPECT_STREQ(tplex::kind_name(static_cast<std::uint8_t>(k)), "Unknown") << k;
}

TEST(Listing, EveryKindInTheDictionary) {
    LexSession s;
    tplex::dict_clear();
    const int kinds[] = {2, 4, 9, 10, 12, 16, 24, 25, 33, 34};
    std::string expected;
    int line = 1;
    for (int k : kinds) {
        std::string name = "K" + std::to_string(k);
        ASSERT_EQ(tplex::dict_lookup(name.data()), 0);
        ASSERT_EQ(tplex::dict_insert(static_cast<std::uint8_t>(k), 0, name.c_str()), 0);
    }
    int pauses = 0;
    expected = expected_listing(true, &pauses);
    (void)line;
    EXPECT_EQ(pauses, 1);
    EXPECT_EQ(listing(1, "k"), expected);
    for (const char *n : {"String", "Unknown", "Reserved Word", "Identifier", "Hash Word", "Hash Definition",
                          "PDF String", "Char"})
        EXPECT_NE(expected.find(n), std::string::npos) << n;
}

}  // namespace
