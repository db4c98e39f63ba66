// Loads and unloads libTesu_Utilities by hand: the modules' init objects are built in module
// order and destroyed in exact reverse, the root logger and the registry are made right after
// their module's init objects and outlive the unload, and the library really goes away.
//
// This program is not linked to the library; it reaches the registry through dlsym
// (GetProcAddress on Windows).
#include <gtest/gtest.h>

#include <algorithm>
#include <atomic>
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <memory>
#include <new>
#include <sstream>
#include <string>
#include <vector>

#include "Port_Init.h"
#include "Port_Msg.h"
#include "Port_String.h"
#include "TestPlatform.h"
#include "Tesu_DebugMessenger.h"

// The root logger and the registry are leaked on purpose. LeakSanitizer, where present, is
// told to ignore what is allocated while the library is loaded.
#if defined(_WIN32)
// On Windows a program's own operator new serves that program only (the library takes its
// from the C++ runtime's DLL), and there is no LeakSanitizer.
constexpr bool kSharedAllocator = false;
void (*const __lsan_disable)() = nullptr;
void (*const __lsan_enable)() = nullptr;
#else
// Under ThreadSanitizer the runtime owns operator new and delete: they cannot be replaced.
#if defined(__SANITIZE_THREAD__)
#define TESU_RUNTIME_OWNS_NEW 1
#elif defined(__has_feature)
#if __has_feature(thread_sanitizer)
#define TESU_RUNTIME_OWNS_NEW 1
#endif
#endif
#if defined(TESU_RUNTIME_OWNS_NEW)
constexpr bool kSharedAllocator = false;
#else
constexpr bool kSharedAllocator = true;
#endif
extern "C" void __lsan_disable() __attribute__((weak));
extern "C" void __lsan_enable() __attribute__((weak));
#endif

namespace {

// Global operator new/delete of this program, which the loaded library uses too: they count
// allocations and tell whether one watched pointer has been freed.
std::atomic<long> allocations{0};
std::atomic<const void*> watched{nullptr};
std::atomic<bool> watchedFreed{false};

[[maybe_unused]] void NoteFree(const void* pointer) {
    if (pointer != nullptr && pointer == watched.load()) {
        watchedFreed = true;
    }
}

}  // namespace

#if !defined(TESU_RUNTIME_OWNS_NEW)
void* operator new(std::size_t size) {
    allocations.fetch_add(1);
    if (void* pointer = std::malloc(size == 0 ? 1 : size)) {
        return pointer;
    }
    throw std::bad_alloc();
}
// Not inlined, so that the compiler does not take the free below for a mismatch.
[[gnu::noinline]] void operator delete(void* pointer) noexcept {
    NoteFree(pointer);
    std::free(pointer);
}
[[gnu::noinline]] void operator delete(void* pointer, std::size_t) noexcept {
    NoteFree(pointer);
    std::free(pointer);
}
#endif

namespace {

using Tesu::DebugMessenger;
using LoggerByName = DebugMessenger* (*)(const Port::StringBase<char>&);
using RootLogger = DebugMessenger* (*)();
using ActiveLoggers = std::vector<Port::StringBase<char>>* (*)();
// Constructor and destructor, called as the functions they are in the C++ ABI. On 32-bit
// Windows member functions take `this` in ECX (thiscall), which a plain function pointer
// cannot say; for a function whose only argument is `this`, fastcall passes it the same way.
#if defined(_WIN32) && defined(__i386__)
using Structor = void(__attribute__((fastcall)) *)(DebugMessenger*);
#else
using Structor = void (*)(DebugMessenger*);
#endif

const char* const kModules[] = {
    "Tesu_Tessel2MessageCatcher", "Tesu_DebugMessenger", "Tesu_IPUpdateInfo", "Tesu_MsgMan",
    "Tesu_SetWorkingDirectory",   "Tesu_Utilities",
};
const char* const kInitObjects[] = {
    "Port::FileInit",    "Port::PathListInit", "CitP::InstanceTableInit",
    "CitP::FactoryInit", "Port_MsgManInit",
};
const char* const kRegistryObjects[] = {"rootLogger", "loggerTable"};

template <typename T, std::size_t N>
bool OneOf(const Port::StringBase<char>& text, T (&list)[N]) {
    return std::any_of(std::begin(list), std::end(list),
                       [&](const char* item) { return text.Compare(item) == 0; });
}

// An event as "+owner/what" (made) or "-owner/what" (destroyed), for readable failures.
std::string Describe(const Port::InitEvent& event) {
    return (event.constructed ? "+" : "-") + event.owner.str() + "/" + event.what.str();
}

// The module frame's events: the init objects of the library's modules and the registry's.
std::vector<std::string> FrameEvents(const std::vector<Port::InitEvent>& events) {
    std::vector<std::string> kept;
    for (const auto& event : events) {
        if (OneOf(event.owner, kModules) &&
            (OneOf(event.what, kInitObjects) || OneOf(event.what, kRegistryObjects))) {
            kept.push_back(Describe(event));
        }
    }
    return kept;
}

std::size_t Count(const std::string& text, const std::string& what) {
    std::size_t count = 0;
    for (auto at = text.find(what); at != std::string::npos; at = text.find(what, at + 1)) {
        ++count;
    }
    return count;
}

template <typename Function>
Function Symbol(tesutest::library::Handle library, const char* name) {
    void* address = tesutest::library::Symbol(library, name);
    EXPECT_NE(address, nullptr) << name << ": " << tesutest::library::LastError();
    return reinterpret_cast<Function>(address);
}

TEST(LibraryFrame, LoadBuildsInModuleOrderUnloadDestroysInReverseAndKeepsTheRegistry) {
    std::ostringstream output;
    Port_MsgStream capture("library frame test");
    capture.addMsgStream(output);
    ASSERT_TRUE(Port_MsgDispatcher::addMsgMan(&capture));

    if (__lsan_disable != nullptr) {
        __lsan_disable();
    }
    Port::InitRecorder::Start();
    const long allocationsBeforeLoad = allocations.load();
    const tesutest::library::Handle library = tesutest::library::Open(TESU_LIBRARY_FILE);
    ASSERT_NE(library, nullptr) << tesutest::library::LastError();
    // The library's own allocations go through this program's operator new.
    if (kSharedAllocator) {
        EXPECT_GE(allocations.load() - allocationsBeforeLoad, 2);
    }

    // Made in module order, each module's init objects in their order, the root and the
    // table right after their module's five.
    std::vector<std::string> expectedLoad;
    for (const char* module : kModules) {
        for (const char* object : kInitObjects) {
            expectedLoad.push_back(std::string("+") + module + "/" + object);
        }
        if (std::strcmp(module, "Tesu_DebugMessenger") == 0) {
            for (const char* object : kRegistryObjects) {
                expectedLoad.push_back(std::string("+") + module + "/" + object);
            }
        }
    }
    EXPECT_EQ(FrameEvents(Port::InitRecorder::Events()), expectedLoad);

    auto rootLogger = Symbol<RootLogger>(library, "_ZN4Tesu21DebugMessengerFactory9GetLoggerEv");
    auto loggerByName = Symbol<LoggerByName>(
        library, "_ZN4Tesu21DebugMessengerFactory9GetLoggerERKN4Port10StringBaseIcEE");
    auto activeLoggers =
        Symbol<ActiveLoggers>(library, "_ZN4Tesu21DebugMessengerFactory16GetActiveLoggersEv");
    auto construct = Symbol<Structor>(library, "_ZN4Tesu14DebugMessengerC1Ev");
    auto destroy = Symbol<Structor>(library, "_ZN4Tesu14DebugMessengerD1Ev");
    ASSERT_FALSE(::testing::Test::HasFailure());

    // A fresh registry: the root at off, no named logger yet.
    DebugMessenger* root = loggerByName("root");
    ASSERT_NE(root, nullptr);
    EXPECT_EQ(root, rootLogger());
    EXPECT_TRUE(root->IsOff());
    std::unique_ptr<std::vector<Port::StringBase<char>>> names(activeLoggers());
    EXPECT_TRUE(names->empty());

    DebugMessenger* utilities = loggerByName("utilities");
    DebugMessenger* javavm = loggerByName("javavm");
    EXPECT_EQ(loggerByName("utilities"), utilities);
    names.reset(activeLoggers());
    std::sort(names->begin(), names->end());
    EXPECT_EQ(*names, (std::vector<Port::StringBase<char>>{"javavm", "utilities"}));
    EXPECT_NE(javavm, utilities);

    root->SetLevel(DebugMessenger::DEBUG_NORMAL);
    EXPECT_TRUE(utilities->IsNormal());

    // A logger of the caller's own writes its total-time line when destroyed at normal level:
    // the capture would see one from the root too.
    alignas(DebugMessenger) unsigned char storage[sizeof(DebugMessenger)];
    auto* own = reinterpret_cast<DebugMessenger*>(storage);
    construct(own);
    own->SetLevel(DebugMessenger::DEBUG_NORMAL);
    destroy(own);
    EXPECT_EQ(Count(output.str(), "DEBUG - Total debug time: "), 1u) << output.str();

    const std::size_t eventsBeforeUnload = Port::InitRecorder::Events().size();
    watched = root;
    ASSERT_TRUE(tesutest::library::Close(library)) << tesutest::library::LastError();
    Port::InitRecorder::Stop();
    if (__lsan_enable != nullptr) {
        __lsan_enable();
    }

    EXPECT_FALSE(tesutest::library::IsLoaded(TESU_LIBRARY_FILE))
        << "the library stayed loaded after it was closed";

    // Exactly the reverse of the init objects' construction; the root and the table are not
    // destroyed.
    const auto all = Port::InitRecorder::Events();
    const std::vector<Port::InitEvent> unload(all.begin() + eventsBeforeUnload, all.end());
    std::vector<std::string> expectedUnload;
    for (auto it = expectedLoad.rbegin(); it != expectedLoad.rend(); ++it) {
        const std::string owned = it->substr(1);
        if (owned.find("/rootLogger") == std::string::npos &&
            owned.find("/loggerTable") == std::string::npos) {
            expectedUnload.push_back("-" + owned);
        }
    }
    EXPECT_EQ(FrameEvents(unload), expectedUnload);

    // The root was neither destroyed nor freed, and still holds the level set above.
    EXPECT_EQ(Count(output.str(), "Total debug time"), 1u) << output.str();
    if (kSharedAllocator) {
        EXPECT_FALSE(watchedFreed.load());
    }
    std::int32_t rootLevel = 0;
    std::memcpy(&rootLevel, static_cast<const void*>(root), sizeof rootLevel);
    EXPECT_EQ(rootLevel, DebugMessenger::DEBUG_NORMAL);

    watched = nullptr;
    Port_MsgDispatcher::removeMsgMan(&capture);
    capture.removeMsgStream(output);
}

}  // namespace
