// The token record: the one record of the token scanned last. The
// dictionary and the scanner fill it, the parser reads it by address, so it
// sits below every subsystem that writes it.
#ifndef TPLEX_BASE_TOKEN_H
#define TPLEX_BASE_TOKEN_H

#include "base/compiler.h"
#include "tplex/lexer.h"

namespace tplex {

extern TPLEX_INTERNAL token_record current_token;

}  // namespace tplex

#endif
