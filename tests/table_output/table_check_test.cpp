// The inspector on sound and broken tables, and the round trip: random
// outputs, closed, read back with every placeholder resolved.
#include <map>
#include <random>
#include <string>

#include "table_fixture.h"

namespace tplex::test {
namespace {

class InspectorTest : public TableTest {
protected:
    // A small sound table: 16>20 plain, 24>28 the string "ab"; R 32, 48 bytes.
    Bytes sample(std::uint32_t flags = 0) {
        open(flags);
        std::uint32_t id;
        WriteReference(&id, 0), DefineReferenceHere(nullptr, id, 0), WriteUInt32(0);
        StoreString("ab");
        EXPECT_EQ(CloseOutput(), TPLEX_OK);
        return file();
    }
    // check_table's complaint about the bytes, "" for a sound table.
    static std::string error_of(const Bytes &b) {
        table_check c{};
        std::string error = CheckTable(b.data(), b.size(), &c) ? "" : c.error;
        ReleaseTableCheck(&c);
        return error;
    }
    static Bytes set(Bytes b, std::size_t at, std::uint32_t v) {
        for (int i = 0; i < 4; ++i) b[at + i] = static_cast<std::uint8_t>(v >> 8 * i);
        return b;
    }
};

TEST_F(InspectorTest, BrokenTables) {
    Bytes b = sample();
    EXPECT_EQ(error_of(b), "");
    EXPECT_EQ(error_of(set(b, 12, 61)), "header word at offset 12 is 61, not 60");
    EXPECT_EQ(error_of(set(set(b, 4, 60), 8, 60)).substr(0, 17), "unfinished table:");
    EXPECT_EQ(error_of(set(b, 4, 44)), "header says 44 bytes, the table holds 48");
    EXPECT_EQ(error_of(set(b, 8, 30)),
              "relocation table offset 30 does not fit a table of 48 bytes");
    EXPECT_EQ(error_of(set(b, 32, 30)), "relocation 0: location 30 lies outside offsets 16 to 28");
    EXPECT_EQ(error_of(set(b, 36, 32)),
              "relocation 0: target 32 is not below the relocation table at 32");
    EXPECT_EQ(error_of(set(b, 16, 7)),
              "relocation 0: location 16 holds 0x00000007, not a placeholder");
    EXPECT_EQ(error_of(set(set(b, 32, 24), 36, 29)),
              "relocation 0: target 29 is not the start of a string");
    EXPECT_EQ(error_of(set(b, 28, 0x63636363)),
              "relocation 1: string at 28 has no terminator before 32");
}

// Every prefix of a sound table, raw or hex text, is refused; each is an
// exact-size copy, so the sanitizer sees any read past the data.
TEST_F(InspectorTest, TruncatedAndMalformed) {
    for (std::uint32_t flags : {0u, TPLEX_OUT_HEX_TEXT}) {
        Bytes b = sample(flags);
        for (std::size_t n = 0; n < b.size(); ++n)
            EXPECT_NE(error_of(Bytes(b.begin(), b.begin() + n)), "") << n;
    }
    Bytes text = sample(TPLEX_OUT_HEX_TEXT);
    text[11] = ';';
    EXPECT_EQ(error_of(text), "malformed hex text at character 11");
}

// Random outputs (fixed seeds) of values, blocks, forward and backward
// references and strings: after the close every relocation entry must lead
// from a placeholder to the target the model expects.
TEST_F(InspectorTest, RoundTrip) {
    for (unsigned seed = 1; seed <= 24; ++seed) {
        SCOPED_TRACE(seed);
        std::mt19937 rng(seed);
        auto pick = [&](std::size_t n) { return static_cast<std::uint32_t>(rng() % n); };
        open(seed % 4 * TPLEX_OUT_ALIGN, seed);                    // none, align, hex text, both
        std::map<std::uint32_t, std::vector<std::uint32_t>> uses;  // id -> locations
        std::map<std::uint32_t, std::uint32_t> targets;            // id -> offset
        std::map<std::uint32_t, std::string> expected;             // location -> target
        std::vector<std::uint32_t> ids;                            // the test's own, newest last
        std::uint32_t id = 0;
        auto use = [&](std::uint32_t which) {  // 0: a new forward reference
            ASSERT_EQ(WriteReference(which ? nullptr : &id, which), TPLEX_OK);
            if (which == 0) ids.push_back(id);
            uses[which ? which : id].push_back(output_stream.offset - 4);
        };
        auto define = [&](std::uint32_t which) {  // 0: a new backward reference
            ASSERT_EQ(DefineReferenceHere(which ? nullptr : &id, which, pick(2)), TPLEX_OK);
            if (which == 0) ids.push_back(id);
            targets[which ? which : id] = output_stream.offset;
        };
        for (int step = 0, depth = 0; step < 400; ++step) {
            std::uint32_t what = pick(9);
            if (what == 0) WriteUInt8(static_cast<std::uint8_t>(rng()));
            if (what == 1) WriteUInt16(static_cast<std::uint16_t>(rng())), WriteUInt32(rng());
            if (what == 2) use(0);
            if (what == 3 && !ids.empty()) use(ids[pick(ids.size())]);
            if (what == 4 && !ids.empty() && !targets.count(ids.back())) define(ids.back());
            if (what == 5) define(0);
            if (what == 6 && depth < 5) depth += BeginBlock() == TPLEX_OK;
            if (what == 7 && depth > 0) depth -= EndBlock() == TPLEX_OK;
            if (what == 8) {
                std::string s(pick(8) == 0 ? pick(4000) : pick(20), 'a');  // some spill
                for (char &c : s) c = " abc\"'xyz"[pick(9)];
                ASSERT_EQ(StoreString(s.c_str()), TPLEX_OK);
                expected[output_stream.offset - 4] = s;
            }
        }
        for (std::uint32_t which : ids) {
            if (!targets.count(which)) define(which);
            if (!uses.count(which)) use(which);
        }
        WriteUInt32(0);  // every target lies before the end of the body
        for (auto &[which, locations] : uses) {
            for (std::uint32_t at : locations) expected[at] = "@" + std::to_string(targets[which]);
        }
        const table_check &c = closed();
        ASSERT_EQ(c.relocation_count, expected.size());
        for (std::uint32_t i = 0; i < c.relocation_count; ++i) {
            table_relocation e = TableRelocationAt(&c, i);
            ASSERT_EQ(e.is_string ? TableStringAt(&c, e.target) : "@" + std::to_string(e.target),
                      expected[e.location])
                << "entry " << i;
        }
    }
}

}  // namespace
}  // namespace tplex::test
