#include "Port_String.h"
