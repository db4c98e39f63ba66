// Internal to libTesu_Utilities (not part of its interface, not installed): the separator
// clean-up of a file-list member. It is inline and has no exported symbol; it lives in a
// header so that the tests can run both platforms' forms on any platform.
#ifndef TESU_FILELISTMEMBER_H
#define TESU_FILELISTMEMBER_H

#include <cstddef>

#include "Port_String.h"

namespace Tesu {
namespace FileListMember {

// Turns every "/" and "\" of `member` into "\" when `windowsNt` is true and into "/"
// otherwise, then collapses every run of that separator into one.
inline void NormaliseSeparators(Port::StringBase<char>& member, bool windowsNt) {
    const char separator = windowsNt ? '\\' : '/';
    member.ReplaceChars(windowsNt ? '/' : '\\', separator);
    // One pass that drops every separator following another; the same result as replacing
    // doubled separators until none is left, in time linear in the length.
    if (member.GetIndexOfString(windowsNt ? "\\\\" : "//", Port::COMPARE_EXACT) == Port::NPOS) {
        return;
    }
    Port::StringBase<char> collapsed;
    collapsed.Reserve(member.GetLength());
    const char* text = member.GetText();
    const std::size_t length = member.GetLength();
    std::size_t start = 0;
    for (std::size_t i = 0; i < length; ++i) {
        if (text[i] == separator && i > 0 && text[i - 1] == separator) {
            collapsed.Append(text + start, i - start);
            start = i + 1;
        }
    }
    collapsed.Append(text + start, length - start);
    member = collapsed;
}

}  // namespace FileListMember
}  // namespace Tesu

#endif
