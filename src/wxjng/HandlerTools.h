// What handlers of image formats share.
#pragma once

#include "peru/Exception.h"
#include "peru/strings/String.h"

#include <new>
#include <string>
#include <vector>
#include <wx/log.h>
#include <wx/stream.h>

namespace wxjng {

// The rest of a stream.
inline std::string readAll(wxInputStream& stream) {
    std::string bytes;
    std::vector<char> buffer(64 * 1024);
    while (stream.Read(buffer.data(), buffer.size()).LastRead() > 0)
        bytes.append(buffer.data(), stream.LastRead());
    return bytes;
}

inline bool startsWith(wxInputStream& stream, std::string_view signature) {
    std::string start(signature.size(), '\0');
    return stream.Read(start.data(), start.size()).LastRead() == start.size() && start == signature;
}

// The function's result. Exceptions, which must not pass through the toolkit, become false and, if wanted, a
// line in the toolkit's log.
template <class Function> bool attempt(bool isVerbose, const Function& function) {
    try {
        return function();
    } catch (const peru::CException& error) {
        if (isVerbose)
            wxLogError("%s", wxString::FromUTF8(peru::CString::toStdString(error.getDescription())));
    } catch (const std::bad_alloc&) {
        if (isVerbose) wxLogError("Out of memory");
    }
    return false;
}

} // namespace wxjng
