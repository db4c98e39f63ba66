#include "Port_Init.h"
