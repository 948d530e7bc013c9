// The table output tests' fixture: a temporary table file, the module reset
// after each test, and byte helpers.
#ifndef TPLEX_TESTS_TABLE_FIXTURE_H
#define TPLEX_TESTS_TABLE_FIXTURE_H

#include <gtest/gtest.h>
#include <unistd.h>

#include <cstdio>
#include <fstream>
#include <iterator>
#include <list>
#include <string>
#include <vector>

#include "table_output/references.h"
#include "test_support.h"
#include "tplex/table_output.h"

namespace tplex::test {

using Bytes = std::vector<std::uint8_t>;

// "3c 01 ff": bytes from..to as lower-case hex.
inline std::string hex(const std::uint8_t *b, std::size_t from, std::size_t to) {
    std::string s;
    char item[4];
    for (std::size_t i = from; i < to; ++i) {
        std::snprintf(item, sizeof item, s.empty() ? "%02x" : " %02x", b[i]);
        s += item;
    }
    return s;
}

class TableTest : public ::testing::Test {
protected:
    TempDir dir;
    std::string path = dir.path() + "/out.tbl";

    // The block stack outlives an output: leave no block open for the next test.
    void TearDown() override {
        AbandonOutput(1), FreeOutputTables(), FreeMemoryOutput();
        while (EndBlock() != TPLEX_OUT_NO_OPEN_BLOCK) {
        }
        for (table_check &c : checks_) ReleaseTableCheck(&c);
    }
    void open(std::uint32_t flags = 0, std::uint32_t tag = 0) {
        ASSERT_EQ(OpenOutput(path.c_str(), flags, tag), TPLEX_OK);
    }
    Bytes file() const {
        std::ifstream in(path, std::ios::binary);
        return Bytes(std::istreambuf_iterator<char>(in), std::istreambuf_iterator<char>());
    }
    bool exists() const { return access(path.c_str(), F_OK) == 0; }
    // Closes and returns the checked table (decoded from hex text if need
    // be), valid until the test ends.
    const table_check &closed() {
        EXPECT_EQ(CloseOutput(), TPLEX_OK);
        const Bytes &b = files_.emplace_back(file());
        table_check &c = checks_.emplace_back();
        EXPECT_TRUE(CheckTable(b.data(), b.size(), &c)) << c.error;
        return c;
    }

private:
    std::list<Bytes> files_;
    std::list<table_check> checks_;
};

}  // namespace tplex::test

#endif
