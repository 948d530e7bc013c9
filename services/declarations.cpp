#include "services/declarations.h"

#include <cstdio>

#include "base/token.h"
#include "dict/dictionary.h"
#include "scan/scanner.h"

namespace tplex {

std::uint8_t declare_enabled = 1;
std::uint16_t shared_class_counter = 0;
std::uint16_t general_counter = 1;

void declarations_reset() {
    shared_class_counter = 0;
    general_counter = 1;
}

void declarations_init() {
    declare_enabled = 1;
    declarations_reset();
}

namespace {

inline bool shares_counter(std::uint8_t class_) {
    switch (class_) {
        case 13:
        case 14:
        case 15:
        case 16:
        case 19:
        case 26:
            return true;
        default:
            return false;
    }
}

}  // namespace

std::uint16_t next_ident_number(std::uint8_t class_) {
    std::uint16_t &counter = shares_counter(class_) ? shared_class_counter : general_counter;
    return ++counter;
}

status_code parse_ident(std::uint8_t declare, std::uint8_t class_) {
    const status_code r = next_token_filtered();
    if (r < 0) return r;
    if (declare_enabled != 1) return r;

    token_record &t = current_token;
    if (t.kind == tk_new_identifier) {
        // The number is taken before the insert, so a failed insert uses it up.
        if (declare != 0)
            return dict_insert(class_, static_cast<std::int16_t>(next_ident_number(class_)),
                               t.text);
        return dict_insert(tk_undeclared, class_, t.text);
    }
    if (t.kind == tk_undeclared) {
        if (t.value != class_) return TPLEX_TYPE_MISMATCH;
        if (declare != 0)
            dict_set_kind(class_, static_cast<std::int16_t>(next_ident_number(class_)));
        return 0;
    }
    if (t.kind > tk_undeclared) {
        if (declare != 0) return TPLEX_ALREADY_DECLARED;
        return t.kind == class_ ? 0 : TPLEX_TYPE_MISMATCH;
    }
    return TPLEX_IDENTIFIER_EXPECTED;
}

status_code make_label(std::uint16_t number, std::int16_t code, std::uint8_t mode) {
    char name[16];
    std::snprintf(name, sizeof name, "$lab-%05d", static_cast<int>(number));
    const bool found = dict_lookup(name) == 1;
    if (mode == 1) {
        if (found) return TPLEX_DISASTER;
        return dict_insert(tk_label, code, name);  // a label not stored is a failure
    }
    return found ? 0 : TPLEX_DISASTER;
}

status_code dict_check() {
    if (dict_slots == nullptr) return 0;
    std::uint16_t count = 0;
    for (int s = 0; s < dict_slot_count; ++s) {
        const dict_entry *e = dict_slots[s];
        if (e != nullptr && e->kind == tk_undeclared) {
            std::printf("\nUndeclared Identifier: %s", e->name);
            ++count;
        }
    }
    if (count == 0) return 0;
    std::printf("\nNumber of Undeclared Identifiers = %d", count);
    std::fflush(stdout);
    return TPLEX_UNDECLARED_IDENTIFIER;
}

}  // namespace tplex
