#include "dict/listing.h"

#include <cstdio>

#include "dict/dictionary.h"

namespace tplex {

const char *kind_name(std::uint8_t kind) {
    switch (kind) {
        case tk_string:
            return "String";
        case tk_reserved_word:
            return "Reserved Word";
        case tk_new_identifier:
            return "Identifier";
        case tk_hash_word:
            return "Hash Word";
        case tk_hash_definition:
            return "Hash Definition";
        case tk_pdf_string:
            return "PDF String";
        case tk_char:
            return "Char";
        default:
            return "Unknown";
    }
}

namespace {

void wait_for_key() {
    std::fputs("\n  Press a key", stdout);
    std::fflush(stdout);
    int c;
    do c = std::getchar();
    while (c == 0);  // EOF ends the wait too
}

}  // namespace

void dict_list(std::uint8_t all) {
    list_dictionary(all, true);
}

void list_dictionary(std::uint8_t all, bool pause) {
    std::int16_t line = 1;
    if (dict_slots != nullptr) {
        for (int s = 0; s < dict_slot_count; ++s) {
            const dict_entry *e = dict_slots[s];
            if (e == nullptr) continue;
            if (all == 0 && (e->kind == tk_reserved_word || e->kind == tk_hash_word)) continue;
            ++line;
            std::printf("\n%4d   %-15s   %s", s, kind_name(e->kind), e->name);
            if (pause && line % 10 == 0) wait_for_key();
        }
    }
    std::fputs("\n End of Listing \n", stdout);
    std::fflush(stdout);
}

}  // namespace tplex
