// The symbol dictionary: 1664 slots, linear probing with wrap-around, no
// deletion, no growth. Names are stored in upper case. The operations that
// change the table act on the slot that the last lookup left in
// current_token.slot.
#ifndef TPLEX_DICT_DICTIONARY_H
#define TPLEX_DICT_DICTIONARY_H

#include <cstddef>
#include <cstdint>
#include <cstring>

#include "base/compiler.h"
#include "base/limits.h"
#include "base/token.h"
#include "tplex/lexer.h"

namespace tplex {

// The optional payload of an entry; for a name of kind 4, text1 is its body.
// Each text holds at most 2499 characters; the three are stored back to back
// right after this header, in one block sized to fit them, so a definition
// costs its texts' length rather than three full text fields.
struct hash_definition {
    const char *text1;
    const char *text2;
    const char *text3;
    std::uint8_t flag1, flag2, flag3;
};

// Room for a name of 128 characters, its NUL and zero padding to a whole
// number of 8-byte words, so names compare a word at a time.
inline constexpr std::size_t name_room = (std::size_t{word_max} + 1 + 7) / 8 * 8;

struct dict_entry {
    std::uint8_t kind;
    char name[name_room];  // upper case, at most 128 characters, zero-padded
    std::int16_t code;
    hash_definition *definition;  // null, or owned by the entry
    std::uint8_t length;          // characters in name
};

// The dictionary's state: dict_slot_count slots, null before dict_create.
extern TPLEX_INTERNAL dict_entry **dict_slots;

// The home slot of an upper-case name. Only its first 128 characters count:
// a longer name is stored, hashed and compared as those 128.
std::uint16_t dict_hash(const char *name);
// Upper-cases a-z in place.
void dict_upcase(char *name);

// Upper-cases name in place and searches for it. 1 found (current_token
// takes the entry's kind, code, name and definition), 0 not found, or
// TPLEX_DISASTER when the table is full. Either way has_definition is
// cleared first, and slot is left at the entry or at the free slot where
// an insert of this name goes (unchanged when the table is full).
status_code dict_lookup(char *name);
// The outcome of recent probes of short words, so that a word met again (a
// reserved word, a name in use) costs two compares instead of a hash and a
// probe. A name of at most 16 characters followed by zero bytes is its two
// first words. An outcome holds while no slot changes hands: every insert,
// removal or clearing starts a new generation, which ends all of them. Kind,
// code and definition are read from the entry itself, so changing those
// needs no new generation. Only a lookup with a table keeps an outcome, and
// dropping the table starts a new generation: an outcome that holds implies
// a table.
struct probe_memo {
    std::uint64_t word0, word1;  // the name, zero-padded
    std::uint32_t generation;    // 0: empty
    std::uint16_t slot;          // where the probe ended
    std::uint8_t found;          // 1: slot holds the name; 0: it is the free slot for it
};
inline constexpr std::size_t probe_memo_count = 2048;  // a power of two
inline constexpr std::size_t probe_memo_key_max = 16;  // characters of the longest name kept

struct probe_memo_table {
    probe_memo memo[probe_memo_count]{};
    std::uint32_t generation = 1;
};
extern TPLEX_INTERNAL probe_memo_table probe_memos;

inline std::uint64_t dict_word_at(const char *p) {
    std::uint64_t w;
    std::memcpy(&w, p, sizeof w);
    return w;
}

inline probe_memo &probe_memo_for(std::uint64_t w0, std::uint64_t w1) {
    const std::uint64_t h = (w0 ^ (w1 * 0x9E3779B97F4A7C15ull)) * 0xD6E8FEB86659FD93ull;
    return probe_memos.memo[h >> (64 - 11)];
}
static_assert(probe_memo_count == 1u << 11, "probe_memo_for takes 11 bits");

// A found entry's definition, copied into current_token.
void dict_show_definition(const hash_definition &d);
// A found entry describes itself in current_token (its text too, unless the
// text already reads as the name).
TPLEX_HOT_INLINE void dict_show_entry(const dict_entry &e, bool text_is_name) {
    token_record &t = current_token;
    t.kind = e.kind;
    if (!text_is_name) std::memmove(t.text, e.name, e.length + 1u);
    t.value = e.code;
    if (e.definition != nullptr) dict_show_definition(*e.definition);
}
// dict_lookup_token's probe, its outcome kept for a short name.
status_code dict_lookup_token_probe(std::size_t length);

// The scanner's lookup of current_token.text, which it has already
// upper-cased, whose length (at most 128) it knows, whose characters are
// ASCII, and which it has followed with read_slack zero bytes; w0 and w1 are the
// text's first 16 bytes (the scanner has them at hand). Same results as
// dict_lookup. A kept outcome is used here, in the scan loop.
inline status_code dict_lookup_token_key(std::size_t length, std::uint64_t w0, std::uint64_t w1) {
    token_record &t = current_token;
    const probe_memo &m = probe_memo_for(w0, w1);
    if (length <= probe_memo_key_max && m.word0 == w0 && m.word1 == w1 &&
        m.generation == probe_memos.generation) {
        t.has_definition = 0;
        t.slot = m.slot;
        if (m.found == 0) return 0;
        dict_show_entry(*dict_slots[m.slot], true);
        return 1;
    }
    return dict_lookup_token_probe(length);
}

inline status_code dict_lookup_token(std::size_t length) {
    const char *text = current_token.text;
    return dict_lookup_token_key(length, dict_word_at(text), dict_word_at(text + 8));
}

// Stores a name at current_token.slot: in a new entry when the slot is
// empty, over the entry there when it holds the same name. 0,
// TPLEX_MALLOC_FAILED, TPLEX_DISASTER (the slot holds another name, which
// is never overwritten) or TPLEX_NOT_INITIALISED.
status_code dict_insert(std::uint8_t kind, std::int16_t code, const char *name);
// Takes back the insert just made into an empty slot (nothing inserted
// since): frees the entry at current_token.slot and empties the slot, so the
// table is exactly as it was before the insert.
void dict_discard();
// Changes kind and code of the entry at current_token.slot.
void dict_set_kind(std::uint8_t kind, std::int16_t code);
// Attaches a new definition to the entry at current_token.slot. 0,
// TPLEX_MALLOC_FAILED, TPLEX_DISASTER (no entry there) or
// TPLEX_NOT_INITIALISED.
status_code dict_extend(const char *text1, const char *text2, const char *text3, std::uint8_t flag1,
                        std::uint8_t flag2, std::uint8_t flag3);

// Lifecycle: create allocates the empty slots (0 or TPLEX_MALLOC_FAILED),
// clear empties them (the reset), destroy releases them.
status_code dict_create();
void dict_clear();
void dict_destroy();

}  // namespace tplex

#endif
