// zxmainf_usage_text.cpp - the default of a value that an application may
// define itself: alone in its object, it is left out of the program then.
#include "zxmainf.h"

const char* usage_text = nullptr;
