// Port::FileName: a file name made of a directory part (the head) and a final part (the tail).
//
// Both "/" and "\" separate components in the texts a FileName is given, on every platform;
// the texts it gives back use the platform's separator (GetPathSeparator) wherever they are
// native or absolute. The head, when not empty, always ends in a separator, and joining a
// head with pushed components and a tail leaves exactly one separator between the parts,
// also when the tail begins with one.
#ifndef PORT_FILENAME_H
#define PORT_FILENAME_H

#include "Port_Export.h"
#include "Port_String.h"

namespace Port {

class PORT_API FileName {
  public:
    FileName() = default;
    // Splits `text` after its last separator: the head is everything up to and including that
    // separator, the tail the rest. A text without a separator is all tail. Not explicit: a
    // text may be passed wherever a FileName is asked for.
    FileName(const StringBase<char>& text);  // NOLINT(google-explicit-constructor)
    FileName(const char* text);              // NOLINT(google-explicit-constructor)

    // The directory part, ending in a separator, or the empty text when there is none.
    // With `native` true its separators are the platform's; with `absolute` true it is the
    // head of the absolute form (GetAbsolutePath(false)) instead of the head as given.
    StringBase<char> GetHead(bool native = false, bool absolute = false) const;
    // Sets the directory part; a separator is added at its end when it has none (an empty
    // text leaves no head).
    void SetHead(const StringBase<char>& head);
    // Appends one or more components (a text that may itself hold separators) to the head.
    // Leading and trailing separators of `components` are not doubled.
    void PushPathEnd(const StringBase<char>& components);
    StringBase<char> GetTail() const { return tail_; }
    // Sets the final part. It may begin with, or hold, separators.
    void SetTail(const StringBase<char>& tail);

    // The whole name as given: head followed by tail with exactly one separator between.
    StringBase<char> GetText() const;
    // The whole name with every separator turned into the platform's.
    StringBase<char> MakeNative() const;
    // The absolute form: a relative name is taken from the working directory; "." and ".."
    // components are resolved and repeated separators collapsed, lexically; the result uses
    // the platform's separators and ends in one only when it is the file-system root.
    // `resolveLinks` false leaves symbolic links as they are; true resolves them where the
    // name exists (falling back to the lexical form where it does not).
    // Throws std::runtime_error only when the working directory cannot be read.
    StringBase<char> GetAbsolutePath(bool resolveLinks = false) const;

    // "/" on POSIX, "\" on Windows.
    static char GetPathSeparator();
    // True for "/" and "\".
    static bool IsSeparator(char c) { return c == '/' || c == '\\'; }

  private:
    StringBase<char> head_;
    StringBase<char> tail_;
};

}  // namespace Port

#endif
