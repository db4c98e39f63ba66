#include "Port_Version.h"
