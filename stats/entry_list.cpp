// The empty node that each new entry is copied from.

#include "stats/entry_list.h"

const ContextNode morwick::kEmptyNode = {};
