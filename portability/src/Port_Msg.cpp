#include "Port_Msg.h"
