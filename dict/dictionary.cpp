#include "dict/dictionary.h"

#include <array>
#include <cstring>

#if defined(__SSE2__)
#include <emmintrin.h>
#endif

#include "base/compiler.h"
#include "base/memory.h"
#include "base/text.h"
#include "base/token.h"

namespace tplex {

dict_entry **dict_slots = nullptr;

namespace {

// The hash weight of the character d places before a name's last one: 64,
// 32, 16, 8, 4, 2, 1, repeated.
constexpr std::uint16_t hash_weight(int d) {
    return static_cast<std::uint16_t>(64 >> (d % 7));
}

constexpr std::array<std::uint16_t, word_max> make_hash_weights() {
    std::array<std::uint16_t, word_max> t{};
    for (int d = 0; d < word_max; ++d) t[d] = hash_weight(d);
    return t;
}
constexpr std::array<std::uint16_t, word_max> hash_weights = make_hash_weights();

constexpr std::uint16_t no_slot = 0xFFFF;

// The key of a name: its first word_max characters.
inline std::size_t key_length(const char *name) {
    return text_length(name, word_max);
}

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

#if defined(__SSE2__)
// The hash of an ASCII key followed by 16 zero bytes, 16 characters at a
// time as one multiply-add. Character i of n weighs 64 >> ((n - 1 - i) % 7),
// so the chunk that starts at character s is weighted by row (n - 1 - s) % 7
// of a table of 7 rows; the zero bytes past the key count nothing. The
// bias folds in the 48 subtracted from every character and the 17 more from
// the last one.
struct chunk_weights {
    alignas(16) std::int16_t row[7][16];  // row[m][i] = 64 >> ((m - i) mod 7)
    std::uint16_t bias[word_max + 1];     // 48 times the weights of n characters, plus 17 x 64
};

constexpr chunk_weights make_chunk_weights() {
    chunk_weights t{};
    for (int m = 0; m < 7; ++m)
        for (int i = 0; i < 16; ++i)
            t.row[m][i] = static_cast<std::int16_t>(hash_weight(((m - i) % 7 + 7) % 7));
    int sum = 0;
    for (int n = 1; n <= word_max; ++n) {
        sum += hash_weight(n - 1);
        t.bias[n] = static_cast<std::uint16_t>(48 * sum + 17 * 64);
    }
    return t;
}
constexpr chunk_weights weights = make_chunk_weights();

inline __m128i weigh_chunk(const char *chunk, const std::int16_t *row) {
    const __m128i zero = _mm_setzero_si128();
    const __m128i x = _mm_loadu_si128(reinterpret_cast<const __m128i *>(chunk));
    const __m128i *w = reinterpret_cast<const __m128i *>(row);
    return _mm_add_epi32(_mm_madd_epi16(_mm_unpacklo_epi8(x, zero), w[0]),
                         _mm_madd_epi16(_mm_unpackhi_epi8(x, zero), w[1]));
}

inline std::uint16_t hash_padded(const char *key, std::size_t n) {
    // Most words fit one chunk; its row comes from a small table, not a division.
    static constexpr std::uint8_t first_row[17] = {0, 0, 1, 2, 3, 4, 5, 6, 0,
                                                   1, 2, 3, 4, 5, 6, 0, 1};
    __m128i sum;
    if (n <= 16) {
        sum = weigh_chunk(key, weights.row[first_row[n]]);
    } else {
        sum = _mm_setzero_si128();
        for (std::size_t start = 0; start < n; start += 16)
            sum = _mm_add_epi32(sum, weigh_chunk(key + start, weights.row[(n - 1 - start) % 7]));
    }
    const __m128i pairs = _mm_add_epi32(sum, _mm_shuffle_epi32(sum, 0x4E));
    const __m128i total = _mm_add_epi32(pairs, _mm_shuffle_epi32(pairs, 0xB1));
    return static_cast<std::uint16_t>(_mm_cvtsi128_si32(total) - weights.bias[n]);
}
#endif

// Equal names, both followed by zero bytes up to a whole word.
inline bool same_padded(const char *a, const char *b, std::size_t n) {
    for (std::size_t i = 0; i <= n; i += 8)
        if (dict_word_at(a + i) != dict_word_at(b + i)) return false;
    return true;
}

// The probe: the slot holding the key, or the first empty slot of its chain
// (found false), or no_slot when every slot is taken by other names. A
// padded key is ASCII followed by zero bytes up to 16 past its end.
template <bool padded>
std::uint16_t probe(const char *key, std::size_t n, bool &found) {
#if defined(__SSE2__)
    const std::uint16_t h = padded && n >= 1 ? hash_padded(key, n) : hash_key(key, n);
#else
    const std::uint16_t h = hash_key(key, n);
#endif
    const std::uint16_t start = static_cast<std::uint16_t>(h % dict_slot_count);
    std::uint16_t s = start;
    do {
        const dict_entry *e = dict_slots[s];
        if (e == nullptr) {
            found = false;
            return s;
        }
        if (e->length == n &&
            (padded ? same_padded(e->name, key, n) : std::memcmp(e->name, key, n) == 0)) {
            found = true;
            return s;
        }
        s = next_slot(s);
    } while (s != start);
    found = false;
    return no_slot;
}

}  // namespace

// A found entry's definition, in current_token.
void dict_show_definition(const hash_definition &d) {
    token_record &t = current_token;
    t.has_definition = 1;
    std::strcpy(t.def_text1, d.text1);
    std::strcpy(t.def_text2, d.text2);
    std::strcpy(t.def_text3, d.text3);
    t.def_flag1 = d.flag1;
    t.def_flag2 = d.flag2;
    t.def_flag3 = d.flag3;
}

namespace {

// A padded key is the token's own text, which already reads as the name.
template <bool padded>
status_code lookup_key(const char *key, std::size_t n) {
    current_token.has_definition = 0;
    if (dict_slots == nullptr) return 0;
    bool found = false;
    const std::uint16_t s = probe<padded>(key, n, found);
    if (s == no_slot) return TPLEX_DISASTER;
    if (found) dict_show_entry(*dict_slots[s], padded);
    current_token.slot = s;
    return found ? 1 : 0;
}

// The slots change hands: every outcome kept so far goes.
void new_memo_generation() {
    if (++probe_memos.generation == 0) {  // after 2^32 changes: empty them for real
        std::memset(probe_memos.memo, 0, sizeof probe_memos.memo);
        probe_memos.generation = 1;
    }
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

std::uint16_t dict_hash(const char *name) {
    return static_cast<std::uint16_t>(hash_key(name, key_length(name)) % dict_slot_count);
}

void dict_upcase(char *name) {
    for (; *name != '\0'; ++name) *name = upper_case(*name);
}

status_code dict_lookup(char *name) {
    dict_upcase(name);
    return lookup_key<false>(name, key_length(name));
}

probe_memo_table probe_memos;

status_code dict_lookup_token_probe(std::size_t length) {
    const token_record &t = current_token;
    const status_code r = lookup_key<true>(t.text, length);
    // Nothing is kept without a table, nor when the table is full.
    if (length > probe_memo_key_max || dict_slots == nullptr || r < 0) return r;
    const std::uint64_t w0 = dict_word_at(t.text), w1 = dict_word_at(t.text + 8);
    probe_memo_for(w0, w1) =
        probe_memo{w0, w1, probe_memos.generation, t.slot, static_cast<std::uint8_t>(r)};
    return r;
}

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
    new_memo_generation();
    e->kind = kind;
    std::memset(e->name, 0, sizeof e->name);
    std::memcpy(e->name, name, n);
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

void dict_discard() {
    dict_entry *e = slot_entry();
    if (e == nullptr) return;
    release_entry(e);
    dict_slots[current_token.slot] = nullptr;
    new_memo_generation();
}

void dict_set_kind(std::uint8_t kind, std::int16_t code) {
    dict_entry *e = slot_entry();
    if (e == nullptr) return;
    e->kind = kind;
    e->code = code;
    current_token.kind = kind;
    current_token.value = code;
}

status_code dict_extend(const char *text1, const char *text2, const char *text3, std::uint8_t flag1,
                        std::uint8_t flag2, std::uint8_t flag3) {
    if (dict_slots == nullptr) return TPLEX_NOT_INITIALISED;
    dict_entry *e = slot_entry();
    if (e == nullptr) return TPLEX_DISASTER;  // nothing looked up there to extend
    // The new texts may be copies of the old ones (the token's def_text
    // fields), so the old definition goes only after the copy. Longer texts
    // are cut to 2499 characters.
    const std::size_t n1 = text1 != nullptr ? text_length(text1, text_size - 1) : 0;
    const std::size_t n2 = text2 != nullptr ? text_length(text2, text_size - 1) : 0;
    const std::size_t n3 = text3 != nullptr ? text_length(text3, text_size - 1) : 0;
    auto *d = static_cast<hash_definition *>(mem_alloc(sizeof(hash_definition) + n1 + n2 + n3 + 3));
    if (d != nullptr) {
        char *texts = reinterpret_cast<char *>(d + 1);
        d->text1 = texts;
        texts += copy_text(texts, n1 + 1, text1) + 1;
        d->text2 = texts;
        texts += copy_text(texts, n2 + 1, text2) + 1;
        d->text3 = texts;
        copy_text(texts, n3 + 1, text3);
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
    // An array of entry addresses.  NOLINTNEXTLINE(bugprone-sizeof-expression)
    dict_slots = static_cast<dict_entry **>(mem_alloc(sizeof dict_slots[0] * dict_slot_count));
    if (dict_slots == nullptr) return TPLEX_MALLOC_FAILED;
    for (int s = 0; s < dict_slot_count; ++s) dict_slots[s] = nullptr;
    new_memo_generation();
    return 0;
}

void dict_clear() {
    if (dict_slots == nullptr) return;
    for (int s = 0; s < dict_slot_count; ++s) {
        release_entry(dict_slots[s]);
        dict_slots[s] = nullptr;
    }
    new_memo_generation();
}

void dict_destroy() {
    dict_clear();
    mem_free(dict_slots);
    dict_slots = nullptr;
}

}  // namespace tplex
