// The message system: message sources (Port_MsgManData), the process-wide dispatcher
// (Port_MsgDispatcher), message managers (Port_MsgMan) and the message stream that writes
// messages to output streams (Port_MsgStream).
//
// A message is issued on a source made for the call; the dispatcher hands it to every
// registered manager in order of registration, under one lock, so messages issued on several
// threads never interleave. A manager that is deactivated drops what it receives until it is
// activated again.
#ifndef PORT_MSG_H
#define PORT_MSG_H

#include <atomic>
#include <cstddef>
#include <iosfwd>
#include <memory>
#include <vector>

#include "Port_Export.h"
#include "Port_String.h"

namespace Port {
class Stream;
}

// Message-type codes.
enum Port_MsgType : int {
    PORT_MSG_ERROR = 0,
    PORT_MSG_WARNING = 1,
    PORT_MSG_DETAIL = 2,
    PORT_MSG_FATAL = 4,
    PORT_MSG_STATUS = 7,
    PORT_MSG_INFO = 8,
};

// One message as the dispatcher hands it to the managers. The pointers are valid only for
// the duration of the delivery.
struct Port_Msg {
    int type;
    const char* application;  // never null
    const char* source;       // never null
    int line;
    const char* revision;  // never null
    const char* text;      // the whole message; `length` bytes, NUL bytes possible
    std::size_t length;
};

// A message source: where a message comes from. Made per message with createObject; the
// texts it is given must outlive it (string literals, as callers pass).
class PORT_API Port_MsgManData {
  public:
    // Null texts are taken as empty ones.
    static Port_MsgManData createObject(const char* application, const char* source, int line,
                                        const char* revision);

    // printf-style issuing: `format` and the arguments make the whole message. Outside texts
    // are never passed as `format`; they take the verbatim forms below.
    void issueError(const char* format, ...) const PORT_PRINTF(2, 3);
    void issueWarning(const char* format, ...) const PORT_PRINTF(2, 3);
    void issueStatus(const char* format, ...) const PORT_PRINTF(2, 3);
    void issueInfo(const char* format, ...) const PORT_PRINTF(2, 3);
    void issueDetail(const char* format, ...) const PORT_PRINTF(2, 3);
    void issueFatal(const char* format, ...) const PORT_PRINTF(2, 3);

    // Verbatim issuing: `text` is the whole message, written as it stands ("%" included).
    void issueError(const Port::StringBase<char>& text) const;
    void issueWarning(const Port::StringBase<char>& text) const;
    void issueStatus(const Port::StringBase<char>& text) const;
    void issueInfo(const Port::StringBase<char>& text) const;
    void issueDetail(const Port::StringBase<char>& text) const;
    void issueFatal(const Port::StringBase<char>& text) const;
    // Verbatim issuing of any type code.
    void issue(int type, const char* text, std::size_t length) const;

    const char* application() const { return application_; }
    const char* source() const { return source_; }
    int line() const { return line_; }
    const char* revision() const { return revision_; }

  private:
    Port_MsgManData(const char* application, const char* source, int line, const char* revision);
    const char* application_;
    const char* source_;
    int line_;
    const char* revision_;
};

// A receiver of dispatched messages. New managers are active.
class PORT_API Port_MsgMan {
  public:
    Port_MsgMan() = default;
    Port_MsgMan(const Port_MsgMan&) = delete;
    Port_MsgMan& operator=(const Port_MsgMan&) = delete;
    // Unregisters the manager if its owner has not (owners should, before a derived part is
    // gone).
    virtual ~Port_MsgMan();

    // Switches delivery on. Returns true when the manager was inactive before.
    virtual bool activate();
    // Switches delivery off: messages received meanwhile are dropped. Returns true when the
    // manager was active before.
    virtual bool deactivate();
    bool isActive() const { return active_.load(std::memory_order_acquire); }

    // Called by the dispatcher: hands the message to write() when active, else drops it.
    void receive(const Port_Msg& message);

  protected:
    // Writes one message. Called under the dispatcher's lock.
    virtual void write(const Port_Msg& message) = 0;

  private:
    std::atomic<bool> active_{true};
};

class Port_MsgManList;

// Iterator over a Port_MsgManList.
class PORT_API Port_MsgManListIterator {
  public:
    Port_MsgManListIterator(Port_MsgManList* list, std::size_t index)
        : list_(list), index_(index) {}
    Port_MsgMan*& operator*() const;
    Port_MsgManListIterator& operator++() {
        ++index_;
        return *this;
    }
    Port_MsgManListIterator operator++(int) {
        Port_MsgManListIterator old = *this;
        ++index_;
        return old;
    }
    bool operator!=(const Port_MsgManListIterator& other) const {
        return index_ != other.index_ || list_ != other.list_;
    }
    bool operator==(const Port_MsgManListIterator& other) const { return !(*this != other); }

  private:
    Port_MsgManList* list_;
    std::size_t index_;
};

// A snapshot of the registered managers, in order of registration.
class PORT_API Port_MsgManList {
  public:
    Port_MsgManList() = default;
    explicit Port_MsgManList(std::vector<Port_MsgMan*> managers) : managers_(std::move(managers)) {}
    Port_MsgManListIterator begin() { return Port_MsgManListIterator(this, 0); }
    Port_MsgManListIterator end() { return Port_MsgManListIterator(this, managers_.size()); }
    std::size_t size() const { return managers_.size(); }
    Port_MsgMan*& operator[](std::size_t index) { return managers_[index]; }

  private:
    std::vector<Port_MsgMan*> managers_;
};

inline Port_MsgMan*& Port_MsgManListIterator::operator*() const {
    return (*list_)[index_];
}

// The process-wide dispatcher. All operations are safe from any thread.
class PORT_API Port_MsgDispatcher {
  public:
    // Registers `manager` at the end of the list. False when it is null or already there.
    static bool addMsgMan(Port_MsgMan* manager);
    // Unregisters `manager`. False when it was not registered. Once this returns, the
    // dispatcher no longer delivers to it.
    static bool removeMsgMan(Port_MsgMan* manager);
    // A snapshot of the registered managers, in order of registration.
    static Port_MsgManList getAllMsgMans();
    // Delivers `message` to every registered manager, in order, under the dispatcher's lock.
    // A manager may issue messages from within its write (they are delivered at once, in the
    // same way); it must not register or unregister managers there.
    static void dispatch(const Port_Msg& message);
};

// A manager that writes messages to a set of output streams, with a switch per stream and
// message type. A newly added stream has every type switched on.
//
// Text written, in one write per message and stream, then flushed:
//   error    "ERROR:<application> - <text>"
//   warning  "WARNING:<application> - <text>"
//   fatal    "FATAL:<application> - <text>"
//   others   "<text>"
// followed by a line feed when the text does not already end in one, so that every message is
// whole lines.
//
// The streams are the caller's: the message stream never closes them, and a caller removes a
// stream before destroying it.
class PORT_API Port_MsgStream : public Port_MsgMan {
  public:
    // `name` labels the message stream (may be null); it is copied.
    explicit Port_MsgStream(const char* name);
    // Unregisters if still registered; forgets its streams without touching them.
    ~Port_MsgStream() override;

    // Adds a stream with every type on; adding a stream already in the set changes nothing.
    void addMsgStream(std::ostream& stream);
    void addMsgStream(Port::Stream& stream);
    // Takes a stream out of the set; a stream not in it is ignored.
    void removeMsgStream(std::ostream& stream);
    void removeMsgStream(Port::Stream& stream);
    // Switches delivery of `type` to a stream of the set on or off; a stream not in the set is
    // ignored.
    void enableMsgType(std::ostream& stream, int type);
    void enableMsgType(Port::Stream& stream, int type);
    void disableMsgType(std::ostream& stream, int type);
    void disableMsgType(Port::Stream& stream, int type);
    // Whether `type` reaches `stream`; false for a stream not in the set.
    bool isMsgTypeEnabled(const std::ostream& stream, int type) const;
    bool isMsgTypeEnabled(const Port::Stream& stream, int type) const;

    const Port::StringBase<char>& name() const;

  protected:
    void write(const Port_Msg& message) override;

  private:
    struct Impl;
    std::unique_ptr<Impl> impl_;
};

#endif
