#include "Port_PathList.h"
