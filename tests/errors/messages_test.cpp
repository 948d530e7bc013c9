// The message operations, compared with standard output byte for byte, at
// line 2 of main.src ("two", read through CR LF) being read at depth 1.
#include "errors/messages.h"

#include <gtest/gtest.h>

#include <cstring>
#include <string>

#include "source/source_stack.h"
#include "test_support.h"
#include "tplex/services.h"

namespace tplex {
namespace {

const std::string heading = "\nTemplate compiler error :\n";

// What display_error prints, after checking that sg_FormatError writes the same.
std::string display(status_code code) {
    test::Capture out;
    display_error(code);
    char formatted[TPLEX_DIAGNOSTIC_SIZE];
    const std::size_t n = sg_FormatError(code, formatted, sizeof formatted);
    EXPECT_EQ(std::string(formatted, n), out.text());
    return out.text();
}

// get_error's result, after checking the prefix it printed.
std::string get(status_code code) {
    test::Capture out;
    std::string text = get_error(code);
    EXPECT_EQ(out.text(), "\n\nError:   ");
    return text;
}

std::string at_main(const std::string &message) {
    return heading + message + "\nFile: main.src    Line: 2\ntwo\n";
}

TEST(Messages, CodesAndPositions) {
    test::LexSession s;
    ASSERT_EQ(s.open("one\r\ntwo\r\n"), 1);
    test::next(), test::next();
    std::strcpy(source_stack[1].path, "main.src");  // the short name, not the temporary folder
    EXPECT_EQ(display(TPLEX_BAD_CHARACTER), at_main("Bad Character"));
    EXPECT_EQ(display(TPLEX_CLOSE_FAILED), heading + "Error Closing File\n");  // no position
    EXPECT_EQ(display(TPLEX_STATUS(0xD3470233u)), at_main("unspecified error: d3470233"));
    EXPECT_EQ(get(TPLEX_ALREADY_DEFINED), "Unspecified error. The Parser is now very confused.");
    // Both operations know the same 49 codes, all in 0xD3470201..0xD3470232.
    int listed = 0;
    for (std::uint32_t c = 0xD34701F0u; c < 0xD3470250u; ++c) {
        const std::string text = get(TPLEX_STATUS(c));
        if (text == get(0)) continue;  // the text of every unlisted code
        ++listed;
        EXPECT_TRUE(c >= 0xD3470201u && c <= 0xD3470232u) << std::hex << c;
        if (TPLEX_STATUS(c) != TPLEX_CLOSE_FAILED) {
            EXPECT_EQ(display(TPLEX_STATUS(c)), at_main(text));
        }
    }
    EXPECT_EQ(listed, 49);
    // A buffer too small gets the diagnostic's start and its NUL; the result
    // is the whole length all the same.
    const std::string whole = at_main("Bad Character");
    for (std::size_t size : {0u, 1u, 40u}) {
        char buffer[64] = "x";
        EXPECT_EQ(sg_FormatError(TPLEX_BAD_CHARACTER, size ? buffer : nullptr, size), whole.size());
        EXPECT_EQ(buffer, size ? whole.substr(0, size - 1) : "x") << size;
    }
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

}  // namespace
}  // namespace tplex
