// Converts between handles and objects and between host texts and strings.
#pragma once

#include "peru/IInstanceWrapper.h"
#include "peru/IInterfaceQuery.h"
#include "peru/uri/URI.h"
#include "tonewright/tonewright.h"

#include <new>

namespace tonewright::exports {

using peru::P;

inline TONEWRIGHT_Handle toHandle(peru::IInstanceWrapper* wrapper) {
    return reinterpret_cast<TONEWRIGHT_Handle>(wrapper);
}

// Returns a handle that the host owns; null for an empty object or when out of memory.
inline TONEWRIGHT_Handle wrap(P<peru::IBase> object) {
    if (!object) return nullptr;
    return toHandle(new (std::nothrow) peru::CInstanceWrapper(std::move(object)));
}

inline TONEWRIGHT_Handle wrapText(const peru::CStringArg& text) {
    return toHandle(new (std::nothrow) peru::CStringInstanceWrapper(text));
}

// Returns the T behind a handle; empty for a null handle or a handle of another kind.
template <class T> P<T> unwrap(TONEWRIGHT_Handle handle) {
    auto* wrapper = dynamic_cast<peru::CInstanceWrapper*>(reinterpret_cast<peru::IInstanceWrapper*>(handle));
    return wrapper ? peru::interfaceCast<T>(wrapper->getObject()) : nullptr;
}

inline P<peru::IString> toString(const char16_t* text) {
    return text ? peru::make<peru::CUTF16String>(text, -1) : peru::CString::empty();
}

// Throws CURIFormatError.
inline P<peru::IURI> toURI(const char16_t* text) {
    return peru::make<peru::CURI>(toString(text));
}

} // namespace tonewright::exports
