// Init objects of the layer: reference counters, one per kind, and the recorder.
//
// The counters are constant-initialised atomics, and every other piece of state here is
// allocated on first use and never freed, so init objects may be built and destroyed from any
// library's static constructors and destructors, in any order.
#include "Port_Init.h"

#include <atomic>
#include <iostream>
#include <mutex>

#include "Port_MsgSystem.h"

namespace {

enum Kind : int {
    KIND_FILE = 0,
    KIND_PATH_LIST,
    KIND_INSTANCE_TABLE,
    KIND_FACTORY,
    KIND_MSG_MAN,
    KIND_COUNT
};

const char* const kKindNames[KIND_COUNT] = {"Port::FileInit", "Port::PathListInit",
                                            "CitP::InstanceTableInit", "CitP::FactoryInit",
                                            "Port_MsgManInit"};

std::atomic<int> liveCounts[KIND_COUNT];

// Serialises the first set-up and the last release of a kind with its counting, so that a
// thread building an init object never sees a service half set up.
std::mutex& countMutex() {
    static std::mutex* const mutex = new std::mutex;
    return *mutex;
}

// The file service holds the standard streams for as long as a FileInit lives, so a module
// may write to std::cerr from its static constructors and destructors.
std::ios_base::Init* standardStreams = nullptr;

void setUpFiles() {
    standardStreams = new std::ios_base::Init;
}

void releaseFiles() {
    std::cout.flush();
    std::clog.flush();
    std::cerr.flush();
    delete standardStreams;
    standardStreams = nullptr;
}

void setUp(Kind kind) {
    switch (kind) {
        case KIND_FILE:
            setUpFiles();
            break;
        case KIND_MSG_MAN:
            PortMsgSystem::setUp();
            break;
        default:
            // The roots, the tables and the shared objects are made on first use, in storage
            // that lives as long as the process: nothing to do in advance.
            break;
    }
}

void release(Kind kind) {
    switch (kind) {
        case KIND_FILE:
            releaseFiles();
            break;
        case KIND_MSG_MAN:
            PortMsgSystem::release();
            break;
        default:
            // Values a host has set (roots, versions) stay for the rest of the process.
            break;
    }
}

struct RecorderState {
    std::mutex mutex;
    bool recording = false;
    std::vector<Port::InitEvent> events;
};

RecorderState& recorderState() {
    static RecorderState* const state = new RecorderState;
    return *state;
}

void record(const char* owner, const char* what, bool constructed) {
    RecorderState& state = recorderState();
    std::lock_guard<std::mutex> lock(state.mutex);
    if (state.recording) {
        state.events.push_back(Port::InitEvent{Port::StringBase<char>(owner),
                                               Port::StringBase<char>(what), constructed});
    }
}

void acquire(Kind kind, const char* owner) {
    {
        std::lock_guard<std::mutex> lock(countMutex());
        if (liveCounts[kind].fetch_add(1, std::memory_order_acq_rel) == 0) {
            setUp(kind);
        }
    }
    record(owner, kKindNames[kind], true);
}

void drop(Kind kind, const char* owner) {
    record(owner, kKindNames[kind], false);
    std::lock_guard<std::mutex> lock(countMutex());
    if (liveCounts[kind].fetch_sub(1, std::memory_order_acq_rel) == 1) {
        release(kind);
    }
}

}  // namespace

#define PORT_DEFINE_INIT(Class, kind)                            \
    Class::Class(const char* owner) : owner_(owner) {            \
        acquire(kind, owner_);                                   \
    }                                                            \
    Class::~Class() {                                            \
        drop(kind, owner_);                                      \
    }                                                            \
    int Class::liveCount() {                                     \
        return liveCounts[kind].load(std::memory_order_acquire); \
    }

namespace Port {
PORT_DEFINE_INIT(FileInit, KIND_FILE)
PORT_DEFINE_INIT(PathListInit, KIND_PATH_LIST)
}  // namespace Port

namespace CitP {
PORT_DEFINE_INIT(InstanceTableInit, KIND_INSTANCE_TABLE)
PORT_DEFINE_INIT(FactoryInit, KIND_FACTORY)
}  // namespace CitP

PORT_DEFINE_INIT(Port_MsgManInit, KIND_MSG_MAN)

#undef PORT_DEFINE_INIT

namespace Port {

void InitRecorder::Start() {
    RecorderState& state = recorderState();
    std::lock_guard<std::mutex> lock(state.mutex);
    state.events.clear();
    state.recording = true;
}

void InitRecorder::Stop() {
    RecorderState& state = recorderState();
    std::lock_guard<std::mutex> lock(state.mutex);
    state.recording = false;
}

bool InitRecorder::IsRecording() {
    RecorderState& state = recorderState();
    std::lock_guard<std::mutex> lock(state.mutex);
    return state.recording;
}

std::vector<InitEvent> InitRecorder::Events() {
    RecorderState& state = recorderState();
    std::lock_guard<std::mutex> lock(state.mutex);
    return state.events;
}

void InitRecorder::Note(const char* owner, const char* what, bool constructed) {
    record(owner, what, constructed);
}

}  // namespace Port
