// The whole interface of the portability layer.
#ifndef PORTABILITY_H
#define PORTABILITY_H

#include "Port_Env.h"
#include "Port_Export.h"
#include "Port_File.h"
#include "Port_FileName.h"
#include "Port_Init.h"
#include "Port_Msg.h"
#include "Port_PathList.h"
#include "Port_String.h"
#include "Port_Timer.h"
#include "Port_Version.h"

#endif
