// The message operations, compared with standard output byte for byte.
#include "errors/messages.h"

#include <gtest/gtest.h>

#include <cstring>
#include <string>
#include <vector>

#include "lex_harness.h"
#include "source/source_stack.h"
#include "tplex/services.h"

namespace tplex {
namespace {

const std::string heading = "\nTemplate compiler error :\n";
const std::string confused = "Unspecified error. The Parser is now very confused.";

// What display_error prints, after checking that sg_FormatError writes the same.
std::string display(status_code code) {
    test::Capture out;
    display_error(code);
    char formatted[TPLEX_DIAGNOSTIC_SIZE];
    const std::size_t n = sg_FormatError(code, formatted, sizeof formatted);
    std::string text = out.text();
    EXPECT_EQ(std::string(formatted, n), text);
    return text;
}

// get_error's result, after checking the prefix it printed.
std::string get(status_code code) {
    test::Capture out;
    std::string text = get_error(code);
    EXPECT_EQ(out.text(), "\n\nError:   ");
    return text;
}

// Line 2 of main.src ("two", read through CR LF) being read at depth 1.
class Messages : public ::testing::Test {
protected:
    Messages() {
        EXPECT_EQ(s.open("one\r\ntwo\r\n"), 1);
        test::next();
        test::next();
        std::strcpy(source_stack[1].path, "main.src");
    }
    static std::string at_main(const std::string &message) {
        return heading + message + "\nFile: main.src    Line: 2\ntwo\n";
    }
    test::LexSession s;
};

TEST_F(Messages, ListedAndUnlistedCodes) {
    EXPECT_EQ(display(TPLEX_BAD_CHARACTER), at_main("Bad Character"));
    EXPECT_EQ(display(TPLEX_FIELD_NOT_PRESENT),
              at_main("Not an allowed field not present statement"));
    EXPECT_EQ(display(TPLEX_CLOSE_FAILED), heading + "Error Closing File\n");
    EXPECT_EQ(get(TPLEX_GENERAL_FAILURE), "General Failure Code");
    for (std::uint32_t code :
         {0xD3470231u, 0xD3470233u, 0xD3470200u, 0u, 7u, 0xD347000Bu, 0xD3431001u}) {
        char hex[16];
        std::snprintf(hex, sizeof hex, "%x", code);
        EXPECT_EQ(display(TPLEX_STATUS(code)), at_main(std::string("unspecified error: ") + hex));
        EXPECT_EQ(get(TPLEX_STATUS(code)), confused);
    }
    // Both operations know the same 49 codes, all in 0xD3470201..0xD3470232.
    int listed = 0;
    for (std::uint32_t c = 0xD34701F0u; c < 0xD3470250u; ++c) {
        const std::string text = get(TPLEX_STATUS(c));
        if (text == confused) continue;
        ++listed;
        EXPECT_TRUE(c >= 0xD3470201u && c <= 0xD3470232u) << std::hex << c;
        if (TPLEX_STATUS(c) != TPLEX_CLOSE_FAILED) {
            EXPECT_EQ(display(TPLEX_STATUS(c)), at_main(text));
        }
    }
    EXPECT_EQ(listed, 49);
}

TEST_F(Messages, Position) {
    const std::string at_frame0 = heading + "Bad Character\nFile:     Line: 0\n";
    for (int16_t depth : {0, 20, -1}) {
        source_depth = depth;
        EXPECT_EQ(display(TPLEX_BAD_CHARACTER), at_frame0) << depth;
    }
    source_depth = 1;
    source_stack[1].line_no = 0xFFFFFFFFu;  // opened, no line read yet
    source_stack[1].line_text[0] = '\0';
    EXPECT_EQ(display(TPLEX_BAD_CHARACTER), heading + "Bad Character\nFile: main.src    Line: 0\n");
}

// A buffer too small gets the diagnostic's start and its NUL; the result
// is the whole length all the same.
TEST_F(Messages, FormatCutsToTheBuffer) {
    const std::string whole = at_main("Bad Character");
    EXPECT_EQ(sg_FormatError(TPLEX_BAD_CHARACTER, nullptr, 0), whole.size());
    for (std::size_t size : {1u, 2u, 40u}) {
        char buffer[64];
        std::memset(buffer, 'x', sizeof buffer);
        EXPECT_EQ(sg_FormatError(TPLEX_BAD_CHARACTER, buffer, size), whole.size());
        EXPECT_EQ(std::string(buffer), whole.substr(0, size - 1)) << size;
        EXPECT_EQ(buffer[size], 'x') << size;
    }
}

}  // namespace
}  // namespace tplex
