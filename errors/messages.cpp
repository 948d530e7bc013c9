// The message catalogue: one text per status code from 0xD3470201 on, and
// the two operations that show it to the compiler's user.
#include "errors/messages.h"

#include <cstdint>
#include <cstdio>

#include "base/limits.h"
#include "base/text.h"
#include "source/source_stack.h"
#include "tplex/services.h"

namespace tplex {

namespace {

constexpr std::uint32_t first_listed = 0xD3470201u;
constexpr std::uint32_t slot_count = 50;

// Slot of a code: below first_listed the subtraction wraps to a huge index.
constexpr std::uint32_t slot_of(status_code code) {
    return static_cast<std::uint32_t>(code) - first_listed;
}

constexpr const char *messages[] = {
    "General Failure Code",                                      // D3470201
    "Disaster Failure Code",                                     // D3470202
    "Undeclared Identifier Used",                                // D3470203
    "End of Line in String",                                     // D3470204
    "Bad PDF String",                                            // D3470205
    "End of Line in Character",                                  // D3470206
    "Bad Character",                                             // D3470207
    "Null Filename",                                             // D3470208
    "No Includes to Search for Included File",                   // D3470209
    "Attempting too many Includes",                              // D347020A
    "Bad Directory Name",                                        // D347020B
    "Malloc Failed",                                             // D347020C
    "Bad Match Expression",                                      // D347020D
    "Bad Start to a Block",                                      // D347020E
    "Bad Protocol",                                              // D347020F
    "Bad Template Start",                                        // D3470210
    "Initialisation Failed",                                     // D3470211
    "Reserved Word not Valid at this Point",                     // D3470212
    "Expected Reserved Word to Begin Block",                     // D3470213
    "Bad Template Name",                                         // D3470214
    "Bad Field Start",                                           // D3470215
    "Bad Protocol Block End",                                    // D3470216
    "Bad Template End",                                          // D3470217
    "Digit Bad or Incompatible with Number Base",                // D3470218
    "Bad Constant Definition",                                   // D3470219
    "Invalid Identifier for Template Name",                      // D347021A
    "Duplicate Template Name",                                   // D347021B
    "Template Name - identifier already used for another type",  // D347021C
    "Include File could not be Opened",                          // D347021D
    "Template Generation Instruction Buffer is Full",            // D347021E
    "Template Generation Field Entry Buffer is Full",            // D347021F
    "Message Match Value out of Range for Field Type",           // D3470220
    "Message Match - Too Many Levels of List Nesting",           // D3470221
    "Not a Valid Nibbles String",                                // D3470222
    "A String is not Allowed for this type of Field",            // D3470223
    "Error Closing File",                                        // D3470224
    "Too Many Include Levels",                                   // D3470225
    "Cannot Open Source File",                                   // D3470226
    "Too Many CONST Include Levels",                             // D3470227
    "Identifier Type Mismatch",                                  // D3470228
    "This Identifier has Already been Declared",                 // D3470229
    "An Identifier is Expected at this Point",                   // D347022A
    "A String is Expected at this Point",                        // D347022B
    "Too Many Nested Layers of Hash",                            // D347022C
    "Unexpected Hash Word",                                      // D347022D
    "Extra #endif Encountered",                                  // D347022E
    "Unrecognisd or Invalid Hash Word",                          // D347022F
    "Invalid Generate Field Value",                              // D3470230
    nullptr,                                                     // D3470231: no text
    "Not an allowed field not present statement",                // D3470232
};

static_assert(sizeof messages / sizeof messages[0] == slot_count, "50 slots");
static_assert(same_text(messages[slot_of(TPLEX_GENERAL_FAILURE)], "General Failure Code"),
              "first slot");
static_assert(same_text(messages[slot_of(TPLEX_CLOSE_FAILED)], "Error Closing File"),
              "display_error prints this code in a form of its own");
static_assert(same_text(messages[slot_of(TPLEX_CANNOT_OPEN_SOURCE)], "Cannot Open Source File"),
              "source stack codes");
static_assert(same_text(messages[slot_of(TPLEX_NO_INCLUDE_DIRS)],
                        "No Includes to Search for Included File"),
              "source stack codes");
static_assert(messages[slot_of(TPLEX_STATUS(0xD3470231u))] == nullptr, "the empty slot");
static_assert(same_text(messages[slot_of(TPLEX_FIELD_NOT_PRESENT)],
                        "Not an allowed field not present statement"),
              "last slot");
static_assert(slot_of(TPLEX_STATUS(0xD3470200u)) >= slot_count && slot_of(0) >= slot_count,
              "codes below the catalogue wrap past its end");

constexpr char heading[] = "\nTemplate compiler error :\n";
constexpr const char *close_failed_line = "Error Closing File\n";

// The longest message: the catalogue's, or an unlisted code's.
constexpr std::size_t longest_message() {
    std::size_t longest = sizeof "unspecified error: ffffffff" - 1;
    for (const char *m : messages) {
        std::size_t n = 0;
        while (m != nullptr && m[n] != '\0') ++n;
        if (n > longest) longest = n;
    }
    return longest;
}
static_assert(sizeof heading - 1 + longest_message() + sizeof "\nFile:     Line: -2147483648\n" -
                      1 + (path_size - 1) + (line_size - 1) + 1 <=
                  TPLEX_DIAGNOSTIC_SIZE,
              "a diagnostic fits TPLEX_DIAGNOSTIC_SIZE");
constexpr const char *unlisted_sentence = "Unspecified error. The Parser is now very confused.";

// The frame whose position a diagnostic shows: the current one, or frame 0
// when the depth is out of range. Null before the stack exists.
const source_frame *reported_frame() {
    if (source_stack == nullptr) return nullptr;
    const int depth = source_depth >= 0 && source_depth < source_frame_count ? source_depth : 0;
    return &source_stack[depth];
}

}  // namespace

const char *status_text(status_code code) {
    const std::uint32_t slot = slot_of(code);
    return slot < slot_count ? messages[slot] : nullptr;
}

// Before the stack exists the position reads as an empty path, line 0 and
// an empty line. Path and line are printed with a precision of their field
// size, so a field that a caller left without its NUL is not read past.
std::size_t format_diagnostic(status_code code, char *buffer, std::size_t size) {
    int n;
    if (code == TPLEX_CLOSE_FAILED) {
        n = std::snprintf(buffer, size, "%s%s", heading, close_failed_line);
    } else {
        const char *text = status_text(code);
        char unlisted[32];
        if (text == nullptr) {
            std::snprintf(unlisted, sizeof unlisted, "unspecified error: %x",
                          static_cast<unsigned>(code));
            text = unlisted;
        }
        const source_frame *frame = reported_frame();
        const char *path = frame != nullptr ? frame->path : "";
        const char *line = frame != nullptr ? frame->line_text : "";
        static_assert(no_line_yet + 1u == 0u, "no line yet reads as line 0");
        const std::uint32_t line_no = frame != nullptr ? frame->line_no + 1u : 0u;
        n = std::snprintf(buffer, size, "%s%s\nFile: %.*s    Line: %d\n%.*s", heading, text,
                          path_size - 1, path, static_cast<int>(static_cast<std::int32_t>(line_no)),
                          line_size - 1, line);
    }
    return n > 0 ? static_cast<std::size_t>(n) : 0;
}

void display_error(status_code code) {
    char text[TPLEX_DIAGNOSTIC_SIZE];
    const std::size_t n = format_diagnostic(code, text, sizeof text);
    std::fwrite(text, 1, n < sizeof text ? n : sizeof text - 1, stdout);
    std::fflush(stdout);
}

const char *get_error(status_code code) {
    std::printf("\n\nError:   ");
    std::fflush(stdout);
    const char *text = status_text(code);
    return text != nullptr ? text : unlisted_sentence;
}

}  // namespace tplex
