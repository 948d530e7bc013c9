// The console listing of the dictionary.
#ifndef TPLEX_DICT_LISTING_H
#define TPLEX_DICT_LISTING_H

#include <cstdint>

namespace tplex {

// Prints one line per occupied slot ("\n%4d   %-15s   %s": slot, kind name,
// name), leaving out reserved words and hash words unless all is non-zero,
// and waits for a key (a non-NUL character on standard input, or its end)
// after the 9th line and every 10 lines after it.
void dict_list(std::uint8_t all);
// dict_list, with the pause only when pause is true.
void list_dictionary(std::uint8_t all, bool pause);

// The listing's name of an entry kind ("Unknown" for the kinds it does not
// name).
const char *kind_name(std::uint8_t kind);

}  // namespace tplex

#endif
