// The message operations byte for byte, at line 2 of main.src ("two", read through CR LF).
#include "errors/messages.h"

#include <gtest/gtest.h>

#include <cstring>

#include "source/source_stack.h"
#include "test_support.h"
#include "tplex/services.h"

namespace tplex {
namespace {

// What display_error prints, after checking that sg_FormatError writes the same.
std::string display(status_code code) {
    test::Capture out;
    display_error(code);
    char formatted[TPLEX_DIAGNOSTIC_SIZE];
    EXPECT_EQ(std::string(formatted, sg_FormatError(code, formatted, sizeof formatted)),
              out.text());
    return out.text();
}

// get_error's result, after checking the prefix it printed.
std::string get(status_code code) {
    test::Capture out;
    std::string text = get_error(code);
    EXPECT_EQ(out.text(), "\n\nError:   ");
    return text;
}

std::string at(const char *place = "main.src    Line: 2\ntwo", const char *text = "Bad Character") {
    return std::string("\nTemplate compiler error :\n") + text + "\nFile: " + place + "\n";
}

TEST(Messages, CodesAndPositions) {
    test::LexSession s;
    ASSERT_EQ(s.open("one\r\ntwo\r\n"), 1);
    std::strcpy(source_stack[1].path, "main.src");  // the short name, not the temporary folder
    EXPECT_EQ(display(TPLEX_BAD_CHARACTER), at("main.src    Line: 0"));  // no line read yet
    test::next(), test::next();
    EXPECT_EQ(display(TPLEX_BAD_CHARACTER), at());
    EXPECT_EQ(display(TPLEX_CLOSE_FAILED), "\nTemplate compiler error :\nError Closing File\n");
    EXPECT_EQ(get(TPLEX_ALREADY_DEFINED), "Unspecified error. The Parser is now very confused.");
    int listed = 0;  // 49 codes, all in 0xD3470201..0xD3470232
    for (std::uint32_t c = 0xD3470200u; c <= 0xD3470233u; ++c)
        listed += get(TPLEX_STATUS(c)) != get(0);
    EXPECT_EQ(listed, 49);
    // A buffer too small gets the diagnostic's start and a NUL; the result is the whole length.
    const std::string whole = at();
    for (std::size_t size : {0u, 1u, 40u}) {
        char buffer[64] = "x";
        EXPECT_EQ(sg_FormatError(TPLEX_BAD_CHARACTER, size ? buffer : nullptr, size), whole.size());
        EXPECT_EQ(buffer, size ? whole.substr(0, size - 1) : "x") << size;
    }
    for (int16_t depth : {0, 20, -1}) {  // out of reach: frame 0 stands in
        source_depth = depth;
        EXPECT_EQ(display(TPLEX_BAD_CHARACTER), at("    Line: 0")) << depth;
    }
    EXPECT_EQ(display(TPLEX_STATUS(0xD3470233u)), at("    Line: 0", "unspecified error: d3470233"));
}

}  // namespace
}  // namespace tplex
