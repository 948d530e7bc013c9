#include "services/string_arg.h"

#include "base/limits.h"
#include "base/text.h"
#include "base/token.h"
#include "scan/scanner.h"

namespace tplex {

status_code parse_string(char *out, std::uint8_t mode) {
    const status_code r = next_token_filtered();
    if (r < 0) return r;
    const bool is_string = current_token.kind == tk_string;
    if (mode == 0 || (mode == 1 && !is_string)) {
        if (is_string) return TPLEX_STRING_NOT_ALLOWED;
        out[0] = '\0';
        back_token();
        return 0;
    }
    if (!is_string) return TPLEX_STRING_EXPECTED;
    copy_text(out, text_size, current_token.text);
    return 0;
}

}  // namespace tplex
