// The empty node. Other files only see its declaration; entry_list.h says why.

#include "stats/entry_list.h"

const ContextNode morwick::kEmptyNode = {};
