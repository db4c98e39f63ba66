#include "Tesu_Tessel2MessageCatcher.h"

#include "Port_Init.h"
#include "Tesu_Export.h"

TESU_MODULE_PORTABILITY_INIT("Tesu_Tessel2MessageCatcher")
