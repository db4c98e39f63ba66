#include "Port_FileName.h"
