// Port::PathList and the installation roots (Port::QuarnelPath).
#ifndef PORT_PATHLIST_H
#define PORT_PATHLIST_H

#include <cstddef>
#include <vector>

#include "Port_Export.h"
#include "Port_String.h"

namespace Port {

class PathList;

// Iterator over the entries of a PathList.
class PORT_API PathListIterator {
  public:
    PathListIterator(const PathList* list, std::size_t index) : list_(list), index_(index) {}
    const StringBase<char>& operator*() const;
    PathListIterator& operator++() {
        ++index_;
        return *this;
    }
    PathListIterator operator++(int) {
        PathListIterator old = *this;
        ++index_;
        return old;
    }
    bool operator!=(const PathListIterator& other) const {
        return index_ != other.index_ || list_ != other.list_;
    }
    bool operator==(const PathListIterator& other) const { return !(*this != other); }

  private:
    const PathList* list_;
    std::size_t index_;
};

// An ordered list of directory texts.
class PORT_API PathList {
  public:
    PathList() = default;
    // Splits `text` at `separator`, leaving out empty entries.
    PathList(const StringBase<char>& text, char separator);

    void Append(const StringBase<char>& path) { paths_.push_back(path); }
    void Clear() { paths_.clear(); }
    std::size_t size() const { return paths_.size(); }
    bool empty() const { return paths_.empty(); }
    const StringBase<char>& operator[](std::size_t index) const { return paths_[index]; }

    PathListIterator begin() const { return PathListIterator(this, 0); }
    PathListIterator end() const { return PathListIterator(this, paths_.size()); }

  private:
    std::vector<StringBase<char>> paths_;
};

inline const StringBase<char>& PathListIterator::operator*() const {
    return (*list_)[index_];
}

// The installation roots of the tool set.
//
// Read on first use, never at load: from the environment variable TESSEL_ROOTS, a list
// separated by ":" on POSIX and ";" on Windows (empty entries left out); when it is unset,
// the installation prefix of the layer (the directory above the one holding libPortability).
// A set but empty TESSEL_ROOTS gives an empty list.
//
// The list is shared by the whole process. Reading it is safe from any thread; a host that
// replaces it (SetRoots, Reset) does so while no other thread walks it.
class PORT_API QuarnelPath {
  public:
    // The roots, in search order. The reference stays valid until SetRoots or Reset.
    static const PathList& GetInstance();
    // Replaces the roots for the rest of the process (tools and tests).
    static void SetRoots(const PathList& roots);
    // Forgets the roots; the next GetInstance reads them afresh.
    static void Reset();
    // The character that separates entries of TESSEL_ROOTS on this platform.
    static char GetListSeparator();
    // The installation prefix: the directory above the one holding libPortability, absolute,
    // without trailing separator; empty when it cannot be found.
    static StringBase<char> GetInstallationPrefix();
};

}  // namespace Port

#endif
