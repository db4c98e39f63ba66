#include "Tesu_DebugMessenger.h"

#include "Port_Init.h"

TESU_MODULE_PORTABILITY_INIT("Tesu_DebugMessenger")
