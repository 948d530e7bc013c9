#include "dict/dictionary.h"

#include <cstring>

#include "lex/lexer.h"
#include "lex/memory.h"
#include "lex/text.h"

namespace tplex {

dict_entry **dict_slots = nullptr;
std::uint16_t hash_weights[word_max];

namespace {

constexpr std::uint16_t no_slot = 0xFFFF;

inline char upper(char c) { return (c >= 'a' && c <= 'z') ? static_cast<char>(c - 32) : c; }

// The key of a name: its first word_max characters.
inline std::size_t key_length(const char *name) { return text_length(name, word_max); }

inline std::uint16_t next_slot(std::uint16_t s) {
    return s + 1 == dict_slot_count ? 0 : static_cast<std::uint16_t>(s + 1);
}

// Each byte counts as a signed 8-bit number; everything wraps at 16 bits.
std::uint16_t hash_key(const char *name, std::size_t n) {
    if (n == 0) return 0;  // the empty name lives in slot 0's chain
    const auto *s = reinterpret_cast<const signed char *>(name);
    std::uint16_t h = static_cast<std::uint16_t>((s[n - 1] - 65) * hash_weights[0]);
    for (std::size_t d = 1; d < n; ++d)
        h = static_cast<std::uint16_t>(h + (s[n - 1 - d] - 48) * hash_weights[d]);
    return h;
}

// The probe: the slot holding the key, or the first empty slot of its chain
// (found false), or no_slot when every slot is taken by other names.
std::uint16_t probe(const char *key, std::size_t n, bool &found) {
    const std::uint16_t start = static_cast<std::uint16_t>(hash_key(key, n) % dict_slot_count);
    std::uint16_t s = start;
    do {
        const dict_entry *e = dict_slots[s];
        if (e == nullptr) {
            found = false;
            return s;
        }
        if (e->length == n && std::memcmp(e->name, key, n) == 0) {
            found = true;
            return s;
        }
        s = next_slot(s);
    } while (s != start);
    found = false;
    return no_slot;
}

// A found entry describes itself in current_token.
void show_entry(const dict_entry &e) {
    token_record &t = current_token;
    t.kind = e.kind;
    std::memmove(t.text, e.name, e.length + 1u);
    t.value = e.code;
    if (e.definition != nullptr) {
        const hash_definition &d = *e.definition;
        t.has_definition = 1;
        std::strcpy(t.def_text1, d.text1);
        std::strcpy(t.def_text2, d.text2);
        std::strcpy(t.def_text3, d.text3);
        t.def_flag1 = d.flag1;
        t.def_flag2 = d.flag2;
        t.def_flag3 = d.flag3;
    }
}

status_code lookup_key(const char *key, std::size_t n) {
    current_token.has_definition = 0;
    if (dict_slots == nullptr) return 0;
    bool found = false;
    const std::uint16_t s = probe(key, n, found);
    if (s == no_slot) return TPLEX_DISASTER;
    if (found) show_entry(*dict_slots[s]);
    current_token.slot = s;
    return found ? 1 : 0;
}

// The entry at current_token.slot, or null for an empty or invalid slot.
dict_entry *slot_entry() {
    if (dict_slots == nullptr || current_token.slot >= dict_slot_count) return nullptr;
    return dict_slots[current_token.slot];
}

void release_entry(dict_entry *e) {
    if (e == nullptr) return;
    mem_free(e->definition);
    mem_free(e);
}

}  // namespace

void fill_hash_weights() {
    for (int d = 0; d < word_max; ++d) hash_weights[d] = static_cast<std::uint16_t>(64 >> (d % 7));
}

std::uint16_t dict_hash(const char *name) {
    return static_cast<std::uint16_t>(hash_key(name, key_length(name)) % dict_slot_count);
}

void dict_upcase(char *name) {
    for (; *name != '\0'; ++name) *name = upper(*name);
}

status_code dict_lookup(char *name) {
    dict_upcase(name);
    return lookup_key(name, key_length(name));
}

status_code dict_lookup_token(std::size_t length) { return lookup_key(current_token.text, length); }

status_code dict_insert(std::uint8_t kind, std::int16_t code, const char *name) {
    if (dict_slots == nullptr) return TPLEX_NOT_INITIALISED;
    if (current_token.slot >= dict_slot_count) return TPLEX_DISASTER;
    const std::size_t n = key_length(name);
    dict_entry *&slot = dict_slots[current_token.slot];
    dict_entry *e = slot;
    if (e == nullptr) {
        e = static_cast<dict_entry *>(mem_alloc(sizeof(dict_entry)));
        if (e == nullptr) return TPLEX_MALLOC_FAILED;
        e->definition = nullptr;
        slot = e;
    } else if (e->length != n || std::memcmp(e->name, name, n) != 0) {
        // A stale slot (left by a lookup that found the table full, or set
        // by the caller) holds another name: never overwrite it.
        return TPLEX_DISASTER;
    }
    e->kind = kind;
    std::memcpy(e->name, name, n);
    e->name[n] = '\0';
    e->length = static_cast<std::uint8_t>(n);
    e->code = code;
    // A reused entry loses its definition; nothing else can reach it.
    mem_free(e->definition);
    e->definition = nullptr;

    current_token.kind = kind;
    current_token.value = code;
    std::memmove(current_token.text, e->name, n + 1);
    return 0;
}

void dict_set_kind(std::uint8_t kind, std::int16_t code) {
    dict_entry *e = slot_entry();
    if (e == nullptr) return;
    e->kind = kind;
    e->code = code;
    current_token.kind = kind;
    current_token.value = code;
}

status_code dict_extend(const char *text1, const char *text2, const char *text3,
                        std::uint8_t flag1, std::uint8_t flag2, std::uint8_t flag3) {
    if (dict_slots == nullptr) return TPLEX_NOT_INITIALISED;
    dict_entry *e = slot_entry();
    if (e == nullptr) return TPLEX_DISASTER;  // nothing looked up there to extend
    // The new texts may be copies of the old ones (the token's def_text
    // fields), so the old definition goes only after the copy.
    auto *d = static_cast<hash_definition *>(mem_alloc(sizeof(hash_definition)));
    if (d != nullptr) {
        copy_text(d->text1, text_size, text1);  // longer texts are cut to 2499
        copy_text(d->text2, text_size, text2);
        copy_text(d->text3, text_size, text3);
        d->flag1 = flag1;
        d->flag2 = flag2;
        d->flag3 = flag3;
    }
    mem_free(e->definition);
    e->definition = d;
    return d != nullptr ? 0 : TPLEX_MALLOC_FAILED;
}

status_code dict_create() {
    if (dict_slots != nullptr) return 0;
    dict_slots = static_cast<dict_entry **>(mem_alloc(sizeof(dict_entry *) * dict_slot_count));
    if (dict_slots == nullptr) return TPLEX_MALLOC_FAILED;
    for (int s = 0; s < dict_slot_count; ++s) dict_slots[s] = nullptr;
    return 0;
}

void dict_clear() {
    if (dict_slots == nullptr) return;
    for (int s = 0; s < dict_slot_count; ++s) {
        release_entry(dict_slots[s]);
        dict_slots[s] = nullptr;
    }
}

void dict_destroy() {
    dict_clear();
    mem_free(dict_slots);
    dict_slots = nullptr;
}

}  // namespace tplex
