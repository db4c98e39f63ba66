#include "Port_Timer.h"
