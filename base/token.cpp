#include "base/token.h"

namespace tplex {

token_record current_token;

}  // namespace tplex
