// One whole pass the way the parser drives the library: only the sixteen
// exported functions and the records behind the addresses of sc_lex_setup.
#include <gtest/gtest.h>

#include <cstring>
#include <string>
#include <vector>

#include "test_support.h"
#include "tplex/lexer.h"

using tplex::test::CaptureStdout;
using tplex::test::TempDir;

namespace {

struct Shared {
    token_record *tok = nullptr;
    source_frame *frames = nullptr;
    int16_t *depth = nullptr;
    reserved_word_record *words = nullptr;
    uint8_t *declare = nullptr;
};

// What the parser sees after one call: the result, the record, the file
// and line being read.
struct Seen {
    status_code result;
    uint16_t kind;
    int32_t value;
    std::string text;
    uint16_t slot;
    uint8_t has_definition;
    std::string def1, def2;
    uint8_t flag1;
    int16_t depth;
    std::string path;
    uint32_t line;
    bool operator==(const Seen &o) const {
        return result == o.result && kind == o.kind && value == o.value && text == o.text &&
               slot == o.slot && has_definition == o.has_definition && depth == o.depth &&
               path == o.path && line == o.line &&
               // The definition fields mean something only after a lookup
               // that found one; otherwise they keep an earlier lookup's.
               (has_definition == 0 || (def1 == o.def1 && def2 == o.def2 && flag1 == o.flag1));
    }
};

std::ostream &operator<<(std::ostream &os, const Seen &s) {
    return os << "{" << s.result << " kind " << s.kind << " value " << s.value << " '" << s.text
              << "' slot " << s.slot << " def " << int(s.has_definition) << " '" << s.def1
              << "' depth " << s.depth << " line " << s.line << "}";
}

Seen see(const Shared &sh, status_code r) {
    const source_frame &f = sh.frames[*sh.depth];
    return Seen{r, sh.tok->kind, sh.tok->value, sh.tok->text, sh.tok->slot,
                sh.tok->has_definition, sh.tok->def_text1, sh.tok->def_text2, sh.tok->def_flag1,
                *sh.depth, f.path, f.line_no};
}

// A small parser: declarations after PROTOCOL, TYPE and STATE, uses after
// NEXTSTATE and OUTPUT; a look-ahead with back_token after TYPE names; a
// definition text attached to each protocol name.
std::vector<Seen> parse(const Shared &sh) {
    std::vector<Seen> seen;
    for (int guard = 0; guard < 1000; ++guard) {
        const status_code r = sc_next_token();
        seen.push_back(see(sh, r));
        if (r == tk_end_of_input || r < 0) break;
        if (r != tk_reserved_word) continue;
        switch (sh.tok->value) {
            case 0:  // PROTOCOL name
                seen.push_back(see(sh, parse_ident(1, 13)));
                seen.push_back(see(sh, dict_extend("protocol", "", "", 1, 0, 0)));
                break;
            case 13:  // TYPE name = value
                seen.push_back(see(sh, parse_ident(1, 14)));
                seen.push_back(see(sh, sc_next_token()));  // "="
                seen.push_back(see(sh, sc_next_token()));  // the value
                break;
            case 2:  // STATE name { , name }
                for (;;) {
                    seen.push_back(see(sh, parse_ident(1, 15)));
                    const status_code sep = sc_next_token();
                    seen.push_back(see(sh, sep));
                    if (!(sep == tk_operator && sh.tok->value == ',')) {
                        back_token();
                        break;
                    }
                }
                break;
            case 3:  // NEXTSTATE name
                seen.push_back(see(sh, parse_ident(0, 15)));
                break;
            case 6:  // OUTPUT name
                seen.push_back(see(sh, parse_ident(0, 18)));
                break;
            default:
                break;
        }
    }
    return seen;
}

TEST(Pass, SetupBeforeInitHandsOutANullSourceStack) {
    Shared sh;
    sh.frames = reinterpret_cast<source_frame *>(&sh);  // overwritten
    EXPECT_EQ(sc_lex_setup(&sh.tok, &sh.frames, &sh.depth, &sh.words, &sh.declare), 0);
    EXPECT_EQ(sh.frames, nullptr);
    EXPECT_NE(sh.tok, nullptr);
    EXPECT_EQ(sc_lex_setup(nullptr, nullptr, nullptr, nullptr, nullptr), 0);
    EXPECT_EQ(lex_free(), 0);
}

TEST(Pass, TwoIdenticalPasses) {
    TempDir dir;
    const std::string types = dir.write("types.src", "TYPE width = MAX ;\nTYPE height = 0x20 ;\n");
    const std::string main = dir.write(
        "main.src",
        "#define MAX 10\n"
        "// a protocol\n"
        "PROTOCOL demo ;\n"
        "#include \"" + types + "\" ignored\n"
        "STATE idle , busy ;\n"
        "NEXTSTATE idle ;\n"
        "NEXTSTATE gone ; /* never declared */\n"
        "#ifdef DEBUG\n"
        "OUTPUT dbg ;\n"
        "#endif\n"
        "#ifndef DEBUG\n"
        "OUTPUT nodbg ;\n"
        "#endif\n"
        "<\"pdf\"> 'c' \"str\" x<=-1 ;\n");

    ASSERT_EQ(sc_lex_init(), 0);
    Shared sh;
    ASSERT_EQ(sc_lex_setup(&sh.tok, &sh.frames, &sh.depth, &sh.words, &sh.declare), 0);
    ASSERT_NE(sh.frames, nullptr);
    EXPECT_EQ(*sh.depth, 0);
    EXPECT_EQ(*sh.declare, 1);
    EXPECT_EQ(sh.words[0].code, 0);
    EXPECT_STREQ(sh.words[0].word, "PROTOCOL");
    EXPECT_EQ(sh.words[39].code, 39);
    EXPECT_STREQ(sh.words[39].word, "<=");
    EXPECT_STREQ(sh.words[117].word, "WINDOW");
    EXPECT_EQ(sh.tok->kind, tk_hash_word);
    EXPECT_EQ(sh.tok->value, 205);
    EXPECT_STREQ(sh.tok->text, "INCLUDE");
    EXPECT_EQ(sh.tok->slot, 210);

    char debug[] = "debug";
    char *names[] = {debug};
    ASSERT_EQ(sc_lex_init_defines(names, 1), 0);
    EXPECT_STREQ(debug, "DEBUG");
    ASSERT_EQ(sc_lex_init_file(main.c_str()), 1);
    EXPECT_EQ(*sh.depth, 1);
    EXPECT_STREQ(sh.frames[1].path, main.c_str());

    const std::vector<Seen> first = parse(sh);
    ASSERT_FALSE(first.empty());
    EXPECT_EQ(first.back().result, tk_end_of_input);

    // What the parser saw, in order.
    std::vector<std::string> summary;
    for (const Seen &s : first) summary.push_back(std::to_string(s.result) + ":" + std::to_string(s.kind) + ":" + std::to_string(s.value) + ":" + s.text);
    const std::vector<std::string> expected = {
        "9:9:0:PROTOCOL", "0:13:1:DEMO", "0:13:1:DEMO", "3:3:59:DEMO",
        "9:9:13:TYPE", "0:14:2:WIDTH", "3:3:61:WIDTH", "1:1:10:10", "3:3:59:10",
        "9:9:13:TYPE", "0:14:3:HEIGHT", "3:3:61:HEIGHT", "1:1:32:20", "3:3:59:20",
        "9:9:2:STATE", "0:15:4:IDLE", "3:3:44:IDLE", "0:15:5:BUSY", "3:3:59:BUSY", "3:3:59:BUSY",
        "9:9:3:NEXTSTATE", "0:15:4:IDLE", "3:3:59:IDLE",
        "9:9:3:NEXTSTATE", "0:12:15:GONE", "3:3:59:GONE",
        "9:9:6:OUTPUT", "0:12:18:DBG", "3:3:59:DBG",
        // The value of the last #endif's hash word stays until a token sets one.
        "33:33:204:pdf", "34:34:204:c", "2:2:204:str", "10:10:204:X", "3:3:5:X", "1:1:-1:1", "3:3:59:1",
        "5:5:59:1"};
    EXPECT_EQ(summary, expected);

    // The definition text attached to DEMO, seen by its next lookup.
    EXPECT_EQ(first[1].has_definition, 0);
    // Files and lines: the TYPE lines come from the included file.
    EXPECT_EQ(first[5].depth, 2);
    EXPECT_EQ(first[5].path, types);
    EXPECT_EQ(first[5].line, 0u);
    EXPECT_EQ(first[10].line, 1u);
    EXPECT_EQ(first[15].depth, 1);
    EXPECT_EQ(first[15].line, 4u);
    EXPECT_EQ(first.back().depth, 0);

    {
        CaptureStdout out;
        EXPECT_EQ(dict_check(), TPLEX_UNDECLARED_IDENTIFIER);
        const std::string text = out.text();
        // Both undeclared names, in slot order.
        EXPECT_NE(text.find("\nUndeclared Identifier: GONE"), std::string::npos) << text;
        EXPECT_NE(text.find("\nUndeclared Identifier: DBG"), std::string::npos) << text;
        EXPECT_EQ(text.substr(text.size() - 37), "\nNumber of Undeclared Identifiers = 2");
    }

    // The second pass: the dictionary back to the keywords, the same input.
    ASSERT_EQ(rewind_input(), 1);
    EXPECT_EQ(*sh.depth, 1);
    char debug2[] = "debug";
    char *names2[] = {debug2};
    ASSERT_EQ(sc_lex_init_defines(names2, 1), 0);  // gone with the rewind
    const std::vector<Seen> second = parse(sh);
    ASSERT_EQ(second.size(), first.size());
    for (std::size_t i = 0; i < first.size(); ++i) EXPECT_EQ(second[i], first[i]) << "call " << i;

    EXPECT_EQ(sg_closesources(), 0);
    EXPECT_EQ(lex_free(), 0);
}

TEST(Pass, AThirdPassWithoutDefinesTakesTheOtherBranch) {
    TempDir dir;
    const std::string main = dir.write("main.src", "#ifdef DEBUG\nOUTPUT dbg ;\n#endif\n#ifndef DEBUG\nOUTPUT nodbg ;\n#endif\n");
    ASSERT_EQ(sc_lex_init(), 0);
    Shared sh;
    sc_lex_setup(&sh.tok, &sh.frames, &sh.depth, &sh.words, &sh.declare);
    char debug[] = "DEBUG";
    char *names[] = {debug};
    ASSERT_EQ(sc_lex_init_defines(names, 1), 0);
    ASSERT_EQ(sc_lex_init_file(main.c_str()), 1);
    std::vector<Seen> a = parse(sh);
    ASSERT_EQ(a.size(), 4u);
    EXPECT_EQ(a[1].text, "DBG");
    ASSERT_EQ(rewind_input(), 1);
    std::vector<Seen> b = parse(sh);
    ASSERT_EQ(b.size(), 4u);
    EXPECT_EQ(b[1].text, "NODBG");
    EXPECT_EQ(sg_closesources(), 0);
    EXPECT_EQ(lex_free(), 0);
}

TEST(Pass, DeclarationsSwitchedOffThroughTheSharedFlag) {
    TempDir dir;
    const std::string main = dir.write("main.src", "PROTOCOL demo ; NEXTSTATE demo ;");
    ASSERT_EQ(sc_lex_init(), 0);
    Shared sh;
    sc_lex_setup(&sh.tok, &sh.frames, &sh.depth, &sh.words, &sh.declare);
    ASSERT_EQ(sc_lex_init_file(main.c_str()), 1);
    *sh.declare = 0;
    const std::vector<Seen> seen = parse(sh);
    ASSERT_GE(seen.size(), 2u);
    EXPECT_EQ(seen[1].result, tk_new_identifier);  // read only
    *sh.declare = 1;
    CaptureStdout out;
    EXPECT_EQ(dict_check(), 0);
    EXPECT_EQ(out.text(), "");
    EXPECT_EQ(sg_closesources(), 0);
    EXPECT_EQ(lex_free(), 0);
}

}  // namespace
