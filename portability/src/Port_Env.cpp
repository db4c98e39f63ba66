#include "Port_Env.h"
