// Export macro of libTesu_Utilities, and the portability init objects every module holds.
#ifndef TESU_EXPORT_H
#define TESU_EXPORT_H

#if defined(_WIN32)
#if defined(TESU_BUILDING_LIBRARY)
#define TESU_API __declspec(dllexport)
#else
#define TESU_API __declspec(dllimport)
#endif
#else
#define TESU_API __attribute__((visibility("default")))
#endif

// The five portability init objects of a module, in the order the layer requires. Each module
// puts this first in its source, before its own static objects, so that the layer is set up
// before they are built and released only after they are gone.
#define TESU_MODULE_PORTABILITY_INIT(moduleName)                     \
    namespace {                                                      \
    const Port::FileInit tesuFileInit(moduleName);                   \
    const Port::PathListInit tesuPathListInit(moduleName);           \
    const CitP::InstanceTableInit tesuInstanceTableInit(moduleName); \
    const CitP::FactoryInit tesuFactoryInit(moduleName);             \
    const Port_MsgManInit tesuMsgManInit(moduleName);                \
    }

#endif
