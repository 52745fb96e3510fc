// Localised texts by key.
#pragma once

#include "peru/strings/String.h"

#include <initializer_list>

namespace peru {

// Keys are flat dotted names; the first part is the namespace, the second the class. Thread-safe.
class PERU_API IStringLocalizer : public virtual IBase {
public:
    virtual void clear() = 0;
    virtual void setParent(const P<IStringLocalizer>& parent) = 0;
    virtual void setText(const CStringArg& key, const P<IString>& text) = 0;
    // Returns the localizer's own entry if it is not empty, otherwise the parent's result, otherwise the
    // default text.
    virtual P<IString> getText(const CStringArg& key, const P<IString>& defaultText) = 0;
    // The same without a default text: an empty handle if there is no entry.
    virtual P<IString> findText(const CStringArg& key) = 0;
};

PERU_API P<IStringLocalizer> getStringLocalizer();

// A placeholder such as "%FILE%" and its value.
struct SPlaceholder {
    const char* name;
    CStringArg value;
};

// Replaces every placeholder by its value in a single pass: what a value contains is not replaced again.
PERU_API P<IString> fillPlaceholders(const P<IString>& text,
                                     std::initializer_list<SPlaceholder> placeholders);

// The localised text of a key, or its default, with the placeholders filled in after localising, so that a
// translation may move them.
PERU_API P<IString> localize(const char* key, const char* defaultText,
                             std::initializer_list<SPlaceholder> placeholders = {});

} // namespace peru
