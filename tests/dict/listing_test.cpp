// The dictionary listing, byte for byte, with its key-press pauses fed from
// a file on standard input.
#include "dict/listing.h"

#include <gtest/gtest.h>
#include <unistd.h>

#include <cstdio>
#include <string>

#include "base/token.h"
#include "dict/dictionary.h"
#include "lex_harness.h"
#include "scan/scanner.h"
#include "services/declarations.h"
#include "session/lifecycle.h"

using tplex::test::CaptureStdout;
using tplex::test::LexSession;
using tplex::test::TempDir;

namespace {

// Standard input reads the given bytes for the object's lifetime.
class StdinFrom {
public:
    explicit StdinFrom(const std::string &bytes) : saved_(dup(0)) {
        if (std::freopen(dir_.write("stdin", bytes).c_str(), "r", stdin) == nullptr)
            ADD_FAILURE() << "freopen";
    }
    ~StdinFrom() {
        dup2(saved_, 0);
        close(saved_);
        std::clearerr(stdin);
    }

private:
    TempDir dir_;
    int saved_;
};

// The listing as it should be for the dictionary as it stands: a line per
// entry, "Press a key" after the 9th, 19th, 29th... line.
std::string expected_listing(bool all, int &pauses) {
    static const char *const names[35] = {
        nullptr, nullptr, "String",        nullptr,      nullptr,           nullptr,      nullptr,
        nullptr, nullptr, "Reserved Word", "Identifier", nullptr,           nullptr,      nullptr,
        nullptr, nullptr, nullptr,         nullptr,      nullptr,           nullptr,      nullptr,
        nullptr, nullptr, nullptr,         "Hash Word",  "Hash Definition", nullptr,      nullptr,
        nullptr, nullptr, nullptr,         nullptr,      nullptr,           "PDF String", "Char"};
    std::string out;
    int line = 1;
    pauses = 0;
    for (int s = 0; s < 1664; ++s) {
        const tplex::dict_entry *e = tplex::dict_slots[s];
        if (e == nullptr || (!all && (e->kind == 9 || e->kind == 24))) continue;
        const char *name = e->kind < 35 && names[e->kind] ? names[e->kind] : "Unknown";
        char buf[300];
        std::snprintf(buf, sizeof buf, "\n%4d   %-15s   %s", s, name, e->name);
        out += buf;
        if (++line % 10 == 0) out += "\n  Press a key", ++pauses;
    }
    return out + "\n End of Listing \n";
}

std::string listing(std::uint8_t all, const std::string &keys) {
    StdinFrom in(keys);
    CaptureStdout out;
    tplex::dict_list(all);
    return out.text();
}

TEST(Listing, EveryKeyword) {
    LexSession s;
    int pauses = 0;
    const std::string expected = expected_listing(true, pauses);
    EXPECT_EQ(pauses, 12);  // 123 lines
    EXPECT_EQ(expected.substr(0, 37), "\n  10   Reserved Word     EVENTSTATUS");
    EXPECT_EQ(listing(1, std::string(12, 'k')), expected);
    EXPECT_EQ(listing(0, ""), "\n End of Listing \n");
    tplex::dict_clear();
    EXPECT_EQ(listing(1, ""), "\n End of Listing \n");
}

TEST(Listing, PausesAfterTheNinthLineOfTen) {
    for (const auto &[names, pauses] :
         std::initializer_list<std::pair<int, int>>{{8, 0}, {9, 1}, {19, 2}, {29, 3}}) {
        LexSession s;
        for (int i = 0; i < names; ++i) {
            std::string name = "N" + std::to_string(i);
            char *p = name.data();
            ASSERT_EQ(sc_lex_init_defines(&p, 1), 0);
        }
        int counted = 0;
        const std::string expected = expected_listing(false, counted);
        EXPECT_EQ(counted, pauses);
        EXPECT_EQ(listing(0, std::string(static_cast<std::size_t>(pauses), 'k')), expected)
            << names;
        EXPECT_EQ(listing(0, ""), expected) << "the end of input ends a wait";
    }
}

TEST(Listing, APauseWaitsForACharacterThatIsNotNul) {
    LexSession s;
    for (const char *n : {"A", "B", "C", "D", "E", "F", "G", "H", "I"}) {
        std::string name = n;
        char *p = name.data();
        ASSERT_EQ(sc_lex_init_defines(&p, 1), 0);
    }
    StdinFrom in(std::string("\0\0xyz", 5));
    {
        CaptureStdout out;
        tplex::dict_list(0);
    }
    EXPECT_EQ(std::getchar(), 'y');
}

TEST(Listing, EveryKindHasItsName) {
    LexSession s;
    tplex::dict_clear();
    for (int k : {2, 4, 9, 10, 12, 16, 24, 25, 33, 34}) {
        std::string name = "K" + std::to_string(k);
        ASSERT_EQ(tplex::dict_lookup(name.data()), 0);
        ASSERT_EQ(tplex::dict_insert(static_cast<std::uint8_t>(k), 0, name.c_str()), 0);
    }
    int pauses = 0;
    const std::string expected = expected_listing(true, pauses);
    for (const char *n : {"String", "Unknown", "Reserved Word", "Identifier", "Hash Word",
                          "Hash Definition", "PDF String", "Char"})
        EXPECT_NE(expected.find(n), std::string::npos) << n;
    EXPECT_EQ(listing(1, "k"), expected);
}

}  // namespace
