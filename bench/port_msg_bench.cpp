// Cost of one message through the dispatcher to one message stream that writes to a
// discarding std::ostream. Target: at most 500 ns per message and no allocation once warm.
#include <benchmark/benchmark.h>

#include <atomic>
#include <cstdlib>
#include <new>
#include <ostream>
#include <streambuf>

#include "Port_Msg.h"

namespace {

std::atomic<long> allocations{0};

// Accepts and drops everything.
class NullBuffer : public std::streambuf {
  protected:
    std::streamsize xsputn(const char*, std::streamsize n) override { return n; }
    int overflow(int c) override { return c == traits_type::eof() ? 0 : c; }
};

template <typename Issue>
void runThroughDispatcher(benchmark::State& state, Issue issue) {
    NullBuffer sink;
    std::ostream out(&sink);
    Port_MsgStream manager("bench");
    manager.addMsgStream(out);
    Port_MsgDispatcher::addMsgMan(&manager);
    const Port_MsgManData source =
        Port_MsgManData::createObject("tesutil", "../bench/port_msg_bench", 1, "$Revision$");
    issue(source);  // warm up: the stream's buffer reaches its working size
    const long before = allocations.load();
    for (auto _ : state) {
        issue(source);
    }
    const long allocated = allocations.load() - before;
    Port_MsgDispatcher::removeMsgMan(&manager);
    manager.removeMsgStream(out);
    state.counters["allocations"] = static_cast<double>(allocated);
    if (allocated != 0) {
        state.SkipWithError("a message allocated memory");
    }
}

void BM_VerbatimStatusLine(benchmark::State& state) {
    const Port::StringBase<char> line("DEBUG[utilities] - Looking for tessel/ip/quarnel/cores\n");
    runThroughDispatcher(state,
                         [&line](const Port_MsgManData& source) { source.issueStatus(line); });
}
BENCHMARK(BM_VerbatimStatusLine);

void BM_FormattedError(benchmark::State& state) {
    runThroughDispatcher(state, [](const Port_MsgManData& source) {
        source.issueError("Cannot open %s\n", "/opt/tessel/data/file_list.txt");
    });
}
BENCHMARK(BM_FormattedError);

}  // namespace

[[gnu::noinline]] void* operator new(std::size_t size) {
    allocations.fetch_add(1, std::memory_order_relaxed);
    if (void* p = std::malloc(size == 0 ? 1 : size)) {
        return p;
    }
    throw std::bad_alloc();
}

// Not inlined, so that the compiler does not take the free below for a mismatch.
[[gnu::noinline]] void operator delete(void* p) noexcept {
    std::free(p);
}

[[gnu::noinline]] void operator delete(void* p, std::size_t) noexcept {
    std::free(p);
}

BENCHMARK_MAIN();
