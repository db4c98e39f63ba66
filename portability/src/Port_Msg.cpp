// The message system: sources, the dispatcher, managers and the message stream.
//
// One recursive mutex, owned by the dispatcher, guards the list of managers, every message
// stream's set of output streams and every delivery. Messages are thus written one at a time
// whatever thread issues them, and a manager may issue further messages from within its
// write. The dispatcher's storage is allocated once and never freed, so issuing, registering
// and unregistering stay safe during static destruction in any library.
#include "Port_Msg.h"

#include <cstdarg>
#include <cstdint>
#include <cstdio>
#include <mutex>
#include <ostream>
#include <string>
#include <utility>
#include <vector>

#include "Port_File.h"
#include "Port_MsgSystem.h"

namespace {

struct DispatcherState {
    std::recursive_mutex mutex;
    std::vector<Port_MsgMan*> managers;
};

DispatcherState& dispatcherState() {
    static DispatcherState* const state = new DispatcherState;
    return *state;
}

using Lock = std::lock_guard<std::recursive_mutex>;

// Formats and issues one message. Most texts fit the stack buffer; a longer one is formatted
// again into a heap buffer of the exact size.
void issueFormatted(const Port_MsgManData& source, int type, const char* format, std::va_list args)
    PORT_PRINTF(3, 0);

void issueFormatted(const Port_MsgManData& source, int type, const char* format,
                    std::va_list args) {
    if (format == nullptr) {
        source.issue(type, "", 0);
        return;
    }
    char small[1024];
    std::va_list first;
    va_copy(first, args);
    const int needed = std::vsnprintf(small, sizeof small, format, first);
    va_end(first);
    if (needed < 0) {
        // An encoding error leaves no text; the message still arrives, empty.
        source.issue(type, "", 0);
        return;
    }
    const auto length = static_cast<std::size_t>(needed);
    if (length < sizeof small) {
        source.issue(type, small, length);
        return;
    }
    std::string large(length, '\0');
    std::va_list second;
    va_copy(second, args);
    std::vsnprintf(&large[0], length + 1, format, second);
    va_end(second);
    source.issue(type, large.data(), length);
}

}  // namespace

namespace PortMsgSystem {

void setUp() {
    dispatcherState();
}

void release() {
    DispatcherState& state = dispatcherState();
    Lock lock(state.mutex);
    // Message streams flush after every message, so nothing is left to write out.
    state.managers.clear();
    state.managers.shrink_to_fit();
}

}  // namespace PortMsgSystem

// --- Port_MsgManData ---------------------------------------------------------------------

Port_MsgManData::Port_MsgManData(const char* application, const char* source, int line,
                                 const char* revision)
    : application_(application != nullptr ? application : ""),
      source_(source != nullptr ? source : ""),
      line_(line),
      revision_(revision != nullptr ? revision : "") {}

Port_MsgManData Port_MsgManData::createObject(const char* application, const char* source, int line,
                                              const char* revision) {
    return Port_MsgManData(application, source, line, revision);
}

#define PORT_MSG_DEFINE_ISSUE(Name, type)                                  \
    void Port_MsgManData::Name(const char* format, ...) const {            \
        std::va_list args;                                                 \
        va_start(args, format);                                            \
        issueFormatted(*this, type, format, args);                         \
        va_end(args);                                                      \
    }                                                                      \
    void Port_MsgManData::Name(const Port::StringBase<char>& text) const { \
        issue(type, text.GetText(), text.GetLength());                     \
    }

PORT_MSG_DEFINE_ISSUE(issueError, PORT_MSG_ERROR)
PORT_MSG_DEFINE_ISSUE(issueWarning, PORT_MSG_WARNING)
PORT_MSG_DEFINE_ISSUE(issueStatus, PORT_MSG_STATUS)
PORT_MSG_DEFINE_ISSUE(issueInfo, PORT_MSG_INFO)
PORT_MSG_DEFINE_ISSUE(issueDetail, PORT_MSG_DETAIL)
PORT_MSG_DEFINE_ISSUE(issueFatal, PORT_MSG_FATAL)

#undef PORT_MSG_DEFINE_ISSUE

void Port_MsgManData::issue(int type, const char* text, std::size_t length) const {
    Port_Msg message;
    message.type = type;
    message.application = application_;
    message.source = source_;
    message.line = line_;
    message.revision = revision_;
    message.text = text != nullptr ? text : "";
    message.length = text != nullptr ? length : 0;
    Port_MsgDispatcher::dispatch(message);
}

// --- Port_MsgMan -------------------------------------------------------------------------

Port_MsgMan::~Port_MsgMan() {
    // Last resort: by now a derived part is gone, but at least nothing is delivered to this
    // object any more once the dispatcher has let go of it.
    Port_MsgDispatcher::removeMsgMan(this);
}

bool Port_MsgMan::activate() {
    return !active_.exchange(true, std::memory_order_acq_rel);
}

bool Port_MsgMan::deactivate() {
    return active_.exchange(false, std::memory_order_acq_rel);
}

void Port_MsgMan::receive(const Port_Msg& message) {
    if (!isActive()) {
        return;
    }
    // Already held when called by the dispatcher; taken here for direct callers.
    Lock lock(dispatcherState().mutex);
    write(message);
}

// --- Port_MsgDispatcher ------------------------------------------------------------------

bool Port_MsgDispatcher::addMsgMan(Port_MsgMan* manager) {
    if (manager == nullptr) {
        return false;
    }
    DispatcherState& state = dispatcherState();
    Lock lock(state.mutex);
    for (Port_MsgMan* registered : state.managers) {
        if (registered == manager) {
            return false;
        }
    }
    state.managers.push_back(manager);
    return true;
}

bool Port_MsgDispatcher::removeMsgMan(Port_MsgMan* manager) {
    if (manager == nullptr) {
        return false;
    }
    DispatcherState& state = dispatcherState();
    Lock lock(state.mutex);
    for (auto it = state.managers.begin(); it != state.managers.end(); ++it) {
        if (*it == manager) {
            state.managers.erase(it);
            return true;
        }
    }
    return false;
}

Port_MsgManList Port_MsgDispatcher::getAllMsgMans() {
    DispatcherState& state = dispatcherState();
    Lock lock(state.mutex);
    return Port_MsgManList(state.managers);
}

void Port_MsgDispatcher::dispatch(const Port_Msg& message) {
    DispatcherState& state = dispatcherState();
    Lock lock(state.mutex);
    // By index, re-reading the size: the list must not change during a delivery, but if a
    // manager breaks that rule nothing is read out of bounds.
    for (std::size_t i = 0; i < state.managers.size(); ++i) {
        state.managers[i]->receive(message);
    }
}

// --- Port_MsgStream ----------------------------------------------------------------------

namespace {

// One output stream of a message stream and its switches. Type codes 0 to 63 are switched
// with a bit mask; other codes (rare) are listed when switched off.
struct Target {
    std::ostream* ostream = nullptr;
    Port::Stream* stream = nullptr;
    std::uint64_t offMask = 0;
    std::vector<int> offOther;

    bool enabled(int type) const {
        if (type >= 0 && type < 64) {
            return (offMask & (std::uint64_t{1} << type)) == 0;
        }
        for (int code : offOther) {
            if (code == type) {
                return false;
            }
        }
        return true;
    }

    void set(int type, bool on) {
        if (type >= 0 && type < 64) {
            const std::uint64_t bit = std::uint64_t{1} << type;
            offMask = on ? (offMask & ~bit) : (offMask | bit);
            return;
        }
        for (auto it = offOther.begin(); it != offOther.end(); ++it) {
            if (*it == type) {
                if (on) {
                    offOther.erase(it);
                }
                return;
            }
        }
        if (!on) {
            offOther.push_back(type);
        }
    }
};

// The text is rebuilt for every message in a buffer that keeps its capacity; a buffer grown
// past this size by an unusually long message is given back afterwards.
constexpr std::size_t kKeptBufferCapacity = 64 * 1024;

void composeText(const Port_Msg& message, std::string& text) {
    text.clear();
    const char* prefix = nullptr;
    switch (message.type) {
        case PORT_MSG_ERROR:
            prefix = "ERROR:";
            break;
        case PORT_MSG_WARNING:
            prefix = "WARNING:";
            break;
        case PORT_MSG_FATAL:
            prefix = "FATAL:";
            break;
        default:
            break;
    }
    if (prefix != nullptr) {
        text.append(prefix);
        text.append(message.application);
        text.append(" - ");
    }
    text.append(message.text, message.length);
    if (message.length == 0 || message.text[message.length - 1] != '\n') {
        text.push_back('\n');
    }
}

}  // namespace

struct Port_MsgStream::Impl {
    Port::StringBase<char> name;
    std::vector<Target> targets;
    std::string buffer;
    bool writing = false;  // a write of this stream is under way on the lock's owner

    Target* find(const std::ostream* ostream, const Port::Stream* stream) {
        for (Target& target : targets) {
            if (target.ostream == ostream && target.stream == stream) {
                return &target;
            }
        }
        return nullptr;
    }

    void add(std::ostream* ostream, Port::Stream* stream) {
        if (find(ostream, stream) == nullptr) {
            Target target;
            target.ostream = ostream;
            target.stream = stream;
            targets.push_back(std::move(target));
        }
    }

    void remove(const std::ostream* ostream, const Port::Stream* stream) {
        for (auto it = targets.begin(); it != targets.end(); ++it) {
            if (it->ostream == ostream && it->stream == stream) {
                targets.erase(it);
                return;
            }
        }
    }

    void set(const std::ostream* ostream, const Port::Stream* stream, int type, bool on) {
        if (Target* target = find(ostream, stream)) {
            target->set(type, on);
        }
    }
};

Port_MsgStream::Port_MsgStream(const char* name) : impl_(new Impl) {
    impl_->name = Port::StringBase<char>(name);
}

Port_MsgStream::~Port_MsgStream() {
    Lock lock(dispatcherState().mutex);
    Port_MsgDispatcher::removeMsgMan(this);
    impl_->targets.clear();
}

void Port_MsgStream::addMsgStream(std::ostream& stream) {
    Lock lock(dispatcherState().mutex);
    impl_->add(&stream, nullptr);
}

void Port_MsgStream::addMsgStream(Port::Stream& stream) {
    Lock lock(dispatcherState().mutex);
    impl_->add(nullptr, &stream);
}

void Port_MsgStream::removeMsgStream(std::ostream& stream) {
    Lock lock(dispatcherState().mutex);
    impl_->remove(&stream, nullptr);
}

void Port_MsgStream::removeMsgStream(Port::Stream& stream) {
    Lock lock(dispatcherState().mutex);
    impl_->remove(nullptr, &stream);
}

void Port_MsgStream::enableMsgType(std::ostream& stream, int type) {
    Lock lock(dispatcherState().mutex);
    impl_->set(&stream, nullptr, type, true);
}

void Port_MsgStream::enableMsgType(Port::Stream& stream, int type) {
    Lock lock(dispatcherState().mutex);
    impl_->set(nullptr, &stream, type, true);
}

void Port_MsgStream::disableMsgType(std::ostream& stream, int type) {
    Lock lock(dispatcherState().mutex);
    impl_->set(&stream, nullptr, type, false);
}

void Port_MsgStream::disableMsgType(Port::Stream& stream, int type) {
    Lock lock(dispatcherState().mutex);
    impl_->set(nullptr, &stream, type, false);
}

bool Port_MsgStream::isMsgTypeEnabled(const std::ostream& stream, int type) const {
    Lock lock(dispatcherState().mutex);
    const Target* target = impl_->find(&stream, nullptr);
    return target != nullptr && target->enabled(type);
}

bool Port_MsgStream::isMsgTypeEnabled(const Port::Stream& stream, int type) const {
    Lock lock(dispatcherState().mutex);
    const Target* target = impl_->find(nullptr, &stream);
    return target != nullptr && target->enabled(type);
}

const Port::StringBase<char>& Port_MsgStream::name() const {
    return impl_->name;
}

void Port_MsgStream::write(const Port_Msg& message) {
    Impl& impl = *impl_;
    bool wanted = false;
    for (const Target& target : impl.targets) {
        if (target.enabled(message.type)) {
            wanted = true;
            break;
        }
    }
    if (!wanted) {
        return;
    }

    // A target that issues a message while being written to brings the thread back here; that
    // nested message gets a buffer of its own so the outer text stays intact.
    std::string nestedBuffer;
    const bool nested = impl.writing;
    std::string& text = nested ? nestedBuffer : impl.buffer;
    struct WritingFlag {
        bool& flag;
        bool saved;
        ~WritingFlag() { flag = saved; }
    } flagGuard{impl.writing, impl.writing};
    impl.writing = true;

    composeText(message, text);
    // By index, re-reading the size, so that a target changing the set from within a nested
    // message cannot make this loop read out of bounds.
    for (std::size_t i = 0; i < impl.targets.size(); ++i) {
        const Target& target = impl.targets[i];
        if (!target.enabled(message.type)) {
            continue;
        }
        if (target.ostream != nullptr) {
            std::ostream* out = target.ostream;
            out->write(text.data(), static_cast<std::streamsize>(text.size()));
            out->flush();
        } else if (target.stream != nullptr) {
            Port::Stream* out = target.stream;
            out->write(text.data(), text.size());
            out->flush();
        }
    }
    if (!nested && text.capacity() > kKeptBufferCapacity) {
        std::string().swap(text);
    }
}
