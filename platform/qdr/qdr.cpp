#include "qdr.h"
