#include "util/corvel_home.h"

const char* VMQ_CORVELHOME = nullptr;
