#include "Port_File.h"
