// File name rules: splitting, the default name and validation.
#include "source/file_spec.h"

#include <gtest/gtest.h>

#include <cstring>
#include <string>

namespace tplex {
namespace {

// Splits spec with the expected extension; checks the three parts and what
// is left of the caller's text.
void expect_split(std::string spec, const char *ext, const char *dir, const char *name,
                  const char *ext_part, const char *spec_after) {
    file_spec out;
    std::memset(&out, 'Z', sizeof out);
    split_file_spec(spec.data(), ext, &out);
    EXPECT_STREQ(out.dir_part, dir) << spec;
    EXPECT_STREQ(out.name_part, name) << spec;
    EXPECT_STREQ(out.ext_part, ext_part) << spec;
    EXPECT_STREQ(spec.c_str(), spec_after);
}

std::uint8_t invalid(const std::string &dir, const std::string &name, const std::string &ext) {
    file_spec spec{};
    dir.copy(spec.dir_part, sizeof spec.dir_part - 1);
    name.copy(spec.name_part, sizeof spec.name_part - 1);
    ext.copy(spec.ext_part, sizeof spec.ext_part - 1);
    return file_spec_invalid(&spec);
}

TEST(FileSpec, Split) {
    expect_split("a\\b\\c.x", "x", "a\\b", "c", "x", "c.x");
    expect_split("a\\b\\c.x", "y", "a\\b", "c.x", "", "c.x");
    expect_split("F.X", "x", "", "F.X", "", "F.X");  // case-sensitive
    expect_split("c", "", "", "c", "", "c");
    expect_split("c", "x", "", "c", "", "c");  // an extension is never added
    expect_split(".x", "x", "", ".x", "", ".x");
    expect_split("a.b.c", "c", "", "a.b", "c", "a.b.c");
    expect_split("c.", "", "", "c", "", "c.");  // the text after the stop is empty
    expect_split("\\c.x", "x", "", "\\c", "x", "\\c.x");
    expect_split("a/b\\c", "", "a/b", "c", "", "c");
    expect_split("d\\", "x", "d", "", "", "");
    expect_split("$", "x", "", "$", "x", "$");
    expect_split("d\\$", "x", "d", "$", "", "$");
    expect_split("$.x", "x", "", "$", "x", "$.x");
}

TEST(FileSpec, LongPartsAreCutToTheirFields) {
    expect_split(std::string(300, 'd') + "\\n.x", "x", std::string(199, 'd').c_str(), "n", "x",
                 "n.x");
    expect_split(std::string(100, 'n') + ".x", "x", "", std::string(79, 'n').c_str(), "x",
                 (std::string(100, 'n') + ".x").c_str());
    expect_split("$", "0123456789abcdefghij", "", "$", "0123456789abcde", "$");
    file_spec spec{};
    split_file_spec(std::string(300, 'd').append("\\n").data(), "", &spec);
    EXPECT_EQ(file_spec_invalid(&spec), 1);
}

TEST(FileSpec, DefaultName) {
    file_spec spec{};
    split_file_spec(std::string("$").data(), "x", &spec);
    apply_default_name(&spec, "main");
    EXPECT_STREQ(spec.name_part, "main");
    EXPECT_STREQ(spec.ext_part, "x");
    apply_default_name(&spec, "other");  // only the marker is replaced
    EXPECT_STREQ(spec.name_part, "main");
    split_file_spec(std::string("d\\$").data(), "x", &spec);
    apply_default_name(&spec, "main");
    EXPECT_STREQ(spec.name_part, "main");
    EXPECT_EQ(file_spec_invalid(&spec), 0);
}

TEST(FileSpec, Validity) {
    EXPECT_EQ(invalid("", "", ""), 0);
    EXPECT_EQ(invalid(std::string(100, 'd'), std::string(40, 'n'), std::string(10, 'e')), 0);
    EXPECT_EQ(invalid(std::string(101, 'd'), "n", ""), 1);
    EXPECT_EQ(invalid("", std::string(41, 'n'), ""), 1);
    EXPECT_EQ(invalid("", "n", std::string(11, 'e')), 1);
    EXPECT_EQ(invalid("d", "", ""), 1);
    EXPECT_EQ(invalid("", "", "x"), 0);
    EXPECT_EQ(invalid("a#b\\c/d~-:._ ", "n", ""), 0);
    EXPECT_EQ(invalid("", "n/a~-:_. 9Z", "e/~-:_. "), 0);
    EXPECT_EQ(invalid("", "a#b", ""), 1);
    EXPECT_EQ(invalid("", "\\c", ""), 1);
    EXPECT_EQ(invalid("", "n", "e#"), 1);
    EXPECT_EQ(invalid("", "$", ""), 1);
    EXPECT_EQ(invalid("d$", "n", ""), 1);
    EXPECT_EQ(invalid("", "caf\xC3\xA9", ""), 1);
    EXPECT_EQ(invalid("", "tab\t", ""), 1);
    EXPECT_EQ(invalid("", "n", "*"), 1);
    file_spec unterminated;
    std::memset(&unterminated, 'a', sizeof unterminated);
    EXPECT_EQ(file_spec_invalid(&unterminated), 1);
}

}  // namespace
}  // namespace tplex
