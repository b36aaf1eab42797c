// The empty node that entries begin as copies of.

#include "stats/entry_list.h"

const ContextNode morwick::kEmptyNode = {};
