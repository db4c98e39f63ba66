// Costs of the debug loggers, with their targets:
//   SuppressedNormal   a Normal line on a registry logger whose root is off: <= 3 ns, at most
//                      2.5 times BareLevelTest, and no heap allocation at all
//   BareLevelTest      the same decision made on a bare struct of a level and a parent
//   GetLoggerByName    GetLogger("utilities") once that logger exists: <= 40 ns
//   EnabledNormal      a Normal line delivered through the dispatcher to one message stream
//                      that writes to a discarding std::ostream: <= 500 ns
// Each benchmark runs in several repetitions; the CPU time per iteration of the fastest
// repetition is held against its target. CPU time, because on a shared machine the real time
// also counts the time the thread waited for a processor; the benchmarks run on one thread
// and never wait on purpose, so their CPU time is their cost. The program prints a
// verdict per target and exits with status 1 when one is missed.
#include <benchmark/benchmark.h>

#include <algorithm>
#include <atomic>
#include <cstdint>
#include <cstdlib>
#include <iostream>
#include <limits>
#include <map>
#include <new>
#include <streambuf>
#include <string>
#include <vector>

#include "Port_Msg.h"
#include "Port_String.h"
#include "Tesu_DebugMessenger.h"

// --- allocation counting -------------------------------------------------------------------
// This program's global operator new serves the libraries too, so every heap allocation made
// while a benchmark runs is counted. The benchmarks run on one thread; the counter is atomic
// only so that a stray allocation elsewhere is not a data race, and is bumped without a locked
// instruction so that counting costs next to nothing.

namespace {
std::atomic<std::int64_t> allocationCount{0};

std::int64_t Allocations() {
    return allocationCount.load(std::memory_order_relaxed);
}
}  // namespace

void* operator new(std::size_t size) {
    allocationCount.store(allocationCount.load(std::memory_order_relaxed) + 1,
                          std::memory_order_relaxed);
    if (void* pointer = std::malloc(size == 0 ? 1 : size)) {
        return pointer;
    }
    throw std::bad_alloc();
}
// Not inlined, so that the compiler does not take the free below for a mismatch.
[[gnu::noinline]] void operator delete(void* pointer) noexcept {
    std::free(pointer);
}
[[gnu::noinline]] void operator delete(void* pointer, std::size_t) noexcept {
    std::free(pointer);
}

namespace {

using Tesu::DebugMessenger;
using Tesu::DebugMessengerFactory;

// An output stream that discards everything written to it.
class NullBuffer : public std::streambuf {
  protected:
    int_type overflow(int_type c) override { return traits_type::not_eof(c); }
    std::streamsize xsputn(const char*, std::streamsize count) override { return count; }
};

void BM_SuppressedNormal(benchmark::State& state) {
    DebugMessengerFactory::GetLogger()->SetLevel(DebugMessenger::DEBUG_OFF);
    DebugMessenger* logger = DebugMessengerFactory::GetLogger("bench.suppressed");
    logger->SetLevel(DebugMessenger::DEBUG_INHERIT);
    const Port::StringBase<char> text("a line that the level test drops");

    const std::int64_t before = Allocations();
    for (auto _ : state) {
        benchmark::DoNotOptimize(logger);  // reload the logger and its fields every time
        logger->Normal(text);
    }
    const std::int64_t made = Allocations() - before;
    state.counters["allocations"] = static_cast<double>(made);
    if (made != 0) {
        state.SkipWithError("a suppressed line allocated memory");
    }
}
BENCHMARK(BM_SuppressedNormal);

// The decision of a suppressed line without the logger: a child that inherits, a parent
// with a level of its own.
struct BareLogger {
    std::int32_t level;
    const BareLogger* parent;
};

void BM_BareLevelTest(benchmark::State& state) {
    const BareLogger root{DebugMessenger::DEBUG_OFF, nullptr};
    const BareLogger child{DebugMessenger::DEBUG_INHERIT, &root};
    const BareLogger* logger = &child;
    for (auto _ : state) {
        benchmark::DoNotOptimize(logger);
        std::int32_t level = logger->level;
        if (level == DebugMessenger::DEBUG_INHERIT) {
            level = logger->parent->level;
        }
        bool passes = level >= DebugMessenger::DEBUG_NORMAL;
        benchmark::DoNotOptimize(passes);
    }
}
BENCHMARK(BM_BareLevelTest);

void BM_GetLoggerByName(benchmark::State& state) {
    DebugMessengerFactory::GetLogger("utilities");
    const std::int64_t before = Allocations();
    for (auto _ : state) {
        benchmark::DoNotOptimize(DebugMessengerFactory::GetLogger("utilities"));
    }
    state.counters["allocations/call"] = benchmark::Counter(
        static_cast<double>(Allocations() - before), benchmark::Counter::kAvgIterations);
}
BENCHMARK(BM_GetLoggerByName);

void BM_EnabledNormal(benchmark::State& state) {
    NullBuffer discard;
    std::ostream sink(&discard);
    Port_MsgStream stream("bench");
    stream.addMsgStream(sink);
    Port_MsgDispatcher::addMsgMan(&stream);

    DebugMessengerFactory::GetLogger()->SetLevel(DebugMessenger::DEBUG_OFF);
    DebugMessenger* logger = DebugMessengerFactory::GetLogger("bench.enabled");
    logger->SetLevel(DebugMessenger::DEBUG_NORMAL);
    const Port::StringBase<char> text("stage 17 of 40 done, 3 files read");

    const std::int64_t before = Allocations();
    for (auto _ : state) {
        logger->Normal(text);
    }
    state.counters["allocations/line"] = benchmark::Counter(
        static_cast<double>(Allocations() - before), benchmark::Counter::kAvgIterations);

    logger->SetLevel(DebugMessenger::DEBUG_INHERIT);
    Port_MsgDispatcher::removeMsgMan(&stream);
    stream.removeMsgStream(sink);
}
BENCHMARK(BM_EnabledNormal);

// --- targets -------------------------------------------------------------------------------

// The console report, plus the CPU time of the fastest repetition of each benchmark, in
// nanoseconds.
class TargetReporter : public benchmark::ConsoleReporter {
  public:
    void ReportRuns(const std::vector<Run>& runs) override {
        ConsoleReporter::ReportRuns(runs);
        for (const Run& run : runs) {
            if (run.error_occurred || run.run_type != Run::RT_Iteration) {
                continue;
            }
            const double nanoseconds =
                run.GetAdjustedCPUTime() * (1e9 / benchmark::GetTimeUnitMultiplier(run.time_unit));
            auto found = fastest_.find(run.run_name.function_name);
            if (found == fastest_.end()) {
                fastest_.emplace(run.run_name.function_name, nanoseconds);
            } else {
                found->second = std::min(found->second, nanoseconds);
            }
        }
    }

    // Prints one verdict per target whose benchmarks ran; false when one is missed.
    bool Verdict(std::ostream& out) const {
        bool met = true;
        const auto check = [&](const char* what, bool ok, double value, const char* unit,
                               double limit) {
            out << (ok ? "target met:    " : "target MISSED: ") << what << ": " << value << ' '
                << unit << " (limit " << limit << ' ' << unit << ")\n";
            met = met && ok;
        };
        const double suppressed = Fastest("BM_SuppressedNormal");
        const double bare = Fastest("BM_BareLevelTest");
        const double lookup = Fastest("BM_GetLoggerByName");
        const double enabled = Fastest("BM_EnabledNormal");
        if (Ran(suppressed)) {
            check("suppressed Normal", suppressed <= 3.0, suppressed, "ns", 3.0);
        }
        if (Ran(suppressed) && Ran(bare)) {
            check("suppressed Normal / bare level test", suppressed <= 2.5 * bare,
                  suppressed / bare, "x", 2.5);
        }
        if (Ran(lookup)) {
            check("GetLogger(\"utilities\")", lookup <= 40.0, lookup, "ns", 40.0);
        }
        if (Ran(enabled)) {
            check("enabled Normal to a discarding stream", enabled <= 500.0, enabled, "ns", 500.0);
        }
        return met;
    }

  private:
    static bool Ran(double nanoseconds) { return nanoseconds < kNotRun; }
    double Fastest(const std::string& name) const {
        const auto found = fastest_.find(name);
        return found == fastest_.end() ? kNotRun : found->second;
    }

    static constexpr double kNotRun = std::numeric_limits<double>::infinity();
    std::map<std::string, double> fastest_;
};

}  // namespace

int main(int argc, char** argv) {
    // Several repetitions unless the caller asks otherwise on the command line.
    std::vector<char*> arguments(argv, argv + argc);
    std::string repetitions = "--benchmark_repetitions=5";
    const bool repetitionsGiven = std::any_of(arguments.begin(), arguments.end(), [](char* a) {
        return std::string(a).rfind("--benchmark_repetitions", 0) == 0;
    });
    if (!repetitionsGiven) {
        arguments.insert(arguments.begin() + 1, &repetitions[0]);
    }
    int count = static_cast<int>(arguments.size());
    benchmark::Initialize(&count, arguments.data());
    if (benchmark::ReportUnrecognizedArguments(count, arguments.data())) {
        return 2;
    }
    TargetReporter reporter;
    benchmark::RunSpecifiedBenchmarks(&reporter);
    benchmark::Shutdown();
    return reporter.Verdict(std::cout) ? 0 : 1;
}
