// The registry under a host's own global operator new: one that asks the registry for a logger
// on every allocation (a tracing allocator), and one that fails a chosen allocation. Replacing
// operator new is process-wide, hence a program of its own. On Windows the library's DLL keeps
// the runtime's operator new, so the hooks would not reach it there; ThreadSanitizer's runtime
// defines operator new itself, so it cannot be replaced there.
#include <gtest/gtest.h>

#include <algorithm>
#include <chrono>
#include <cstdlib>
#include <functional>
#include <future>
#include <memory>
#include <new>
#include <string>
#include <thread>
#include <vector>

#include "TestSupport.h"
#include "Tesu_DebugMessenger.h"

#if defined(__has_feature)
#if __has_feature(thread_sanitizer)
#define TESU_TEST_THREAD_SANITIZER 1
#endif
#endif
#if defined(__SANITIZE_THREAD__)
#define TESU_TEST_THREAD_SANITIZER 1
#endif
#if !defined(_WIN32) && !defined(TESU_TEST_THREAD_SANITIZER)
#define TESU_TEST_REPLACES_NEW 1
#endif

namespace {

// Set per thread, so that only the code under test sees the hooks.
thread_local const char* traceName = nullptr;  // the name the tracing hook asks for
thread_local bool inTrace = false;
thread_local long failAt = -1;  // the allocation, counted from 0, that throws
thread_local long allocations = 0;

[[maybe_unused]] void* Allocate(std::size_t size) {
    if (traceName != nullptr && !inTrace) {
        inTrace = true;
        Tesu::DebugMessengerFactory::GetLogger(traceName);
        inTrace = false;
    }
    if (failAt >= 0 && allocations++ == failAt) {
        throw std::bad_alloc();
    }
    void* block = std::malloc(size == 0 ? 1 : size);
    if (block == nullptr) {
        throw std::bad_alloc();
    }
    return block;
}

}  // namespace

#ifdef TESU_TEST_REPLACES_NEW
void* operator new(std::size_t size) {
    return Allocate(size);
}
void* operator new[](std::size_t size) {
    return Allocate(size);
}
void operator delete(void* block) noexcept {
    std::free(block);
}
void operator delete[](void* block) noexcept {
    std::free(block);
}
void operator delete(void* block, std::size_t) noexcept {
    std::free(block);
}
void operator delete[](void* block, std::size_t) noexcept {
    std::free(block);
}
#endif

namespace {

using Tesu::DebugMessenger;
using Tesu::DebugMessengerFactory;

std::string FreshName(const std::string& base) {
    static int serial = 0;
    return base + "#" + std::to_string(++serial);
}

class RegistryAllocTest : public ::testing::Test {
  protected:
    void SetUp() override {
#ifndef TESU_TEST_REPLACES_NEW
        GTEST_SKIP() << "operator new cannot be replaced for the library here";
#endif
        DebugMessengerFactory::GetLogger()->SetLevel(DebugMessenger::DEBUG_NORMAL);
    }
    tesutest::LoggerLevelsReset levels;
    tesutest::MessageCapture capture;
};

// Runs `work` on a thread of its own with the tracing hook asking for `name`; false when it
// has not returned within a generous time (a thread locked out by itself never does).
bool ReturnsWhileTracing(const std::string& name, std::function<void()> work) {
    auto task = std::make_shared<std::packaged_task<void()>>([name, work] {
        traceName = name.c_str();
        work();
        traceName = nullptr;
    });
    std::future<void> done = task->get_future();
    std::thread([task] { (*task)(); }).detach();
    if (done.wait_for(std::chrono::seconds(20)) != std::future_status::ready) {
        return false;
    }
    done.get();
    return true;
}

// The hook asks for another name, for the very name being made (so that the outer request
// finds it made when it comes to insert its own), or runs during a listing.
TEST_F(RegistryAllocTest, LookupsFromWithinAnAllocationReturn) {
    enum Operation { OTHER_NAME, SAME_NAME, LISTING };
    for (Operation operation : {OTHER_NAME, SAME_NAME, LISTING}) {
        SCOPED_TRACE(operation);
        const std::string name = FreshName("alloc.outer");
        const std::string traced = operation == SAME_NAME ? name : FreshName("alloc.trace");
        DebugMessenger* outer = nullptr;
        std::unique_ptr<std::vector<Port::StringBase<char>>> listed;
        ASSERT_TRUE(ReturnsWhileTracing(traced, [&] {
            if (operation == LISTING) {
                listed.reset(DebugMessengerFactory::GetActiveLoggers());
            } else {
                outer = DebugMessengerFactory::GetLogger(name);
            }
        })) << "the registry locked itself out";

        DebugMessenger* tracedLogger = DebugMessengerFactory::GetLogger(traced);
        if (operation == LISTING) {
            ASSERT_NE(listed, nullptr);
            continue;
        }
        EXPECT_EQ(outer, DebugMessengerFactory::GetLogger(name));
        EXPECT_EQ(outer == tracedLogger, operation == SAME_NAME);
        std::unique_ptr<std::vector<Port::StringBase<char>>> names(
            DebugMessengerFactory::GetActiveLoggers());
        EXPECT_EQ(std::count(names->begin(), names->end(), Port::StringBase<char>(name)), 1);
    }
    // The logger made by the losing request was discarded without a word.
    EXPECT_EQ(capture.text(), "");
}

// Every allocation of a first request fails in turn: the request ends in bad_alloc, the logger
// half made is discarded without a "Total debug time" line, and the name can be asked for
// again.
TEST_F(RegistryAllocTest, FailedAllocationsDiscardTheNewLoggerSilently) {
    bool reachedTheEnd = false;
    for (long failing = 0; failing < 100 && !reachedTheEnd; ++failing) {
        SCOPED_TRACE("allocation " + std::to_string(failing));
        const std::string name = FreshName("alloc.fail");
        const Port::StringBase<char> key(name);
        bool threw = false;
        failAt = failing;
        allocations = 0;
        try {
            DebugMessengerFactory::GetLogger(key);
        } catch (const std::bad_alloc&) {
            threw = true;
        }
        failAt = -1;
        reachedTheEnd = allocations <= failing;
        EXPECT_EQ(threw, !reachedTheEnd);
        EXPECT_EQ(capture.text(), "");

        DebugMessenger* logger = DebugMessengerFactory::GetLogger(key);
        EXPECT_EQ(logger, DebugMessengerFactory::GetLogger(key));
        std::unique_ptr<std::vector<Port::StringBase<char>>> names(
            DebugMessengerFactory::GetActiveLoggers());
        EXPECT_EQ(std::count(names->begin(), names->end(), key), 1);
    }
    EXPECT_TRUE(reachedTheEnd);
}

}  // namespace
