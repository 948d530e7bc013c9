/* self_include.tpl: includes itself, for failures.tpl. */
#include "self_include.tpl"
