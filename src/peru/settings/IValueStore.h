// Named typed values in sections: settings.
#pragma once

#include "peru/collections/IEnum.h"
#include "peru/strings/IString.h"

namespace peru {

// A section is a path of names with "/" between them; an empty one is the top. One thread at a time.
//
// A change is kept in memory until flush(), unless the store saves by itself. Changes throw CReadOnlyError
// when the store was opened for reading, CInvalidArgError for names and texts that it cannot hold, and
// CFileError where they are saved at once and cannot be.
class PERU_API IValueStore : public virtual IBase {
public:
    virtual void setString(const CStringArg& section, const CStringArg& name, const CStringArg& value) = 0;
    virtual void setInt(const CStringArg& section, const CStringArg& name, int32_t value) = 0;
    virtual void setInt64(const CStringArg& section, const CStringArg& name, int64_t value) = 0;
    virtual void setBool(const CStringArg& section, const CStringArg& name, bool value) = 0;
    virtual void setDouble(const CStringArg& section, const CStringArg& name, double value) = 0;

    // The default where there is no value or its text is empty. Text that is no number throws CParseError
    // from the three numeric ones; for getBool text other than "true" and "false" is the default.
    virtual P<IString> getString(const CStringArg& section, const CStringArg& name,
                                 const P<IString>& defaultValue) = 0;
    virtual int32_t getInt(const CStringArg& section, const CStringArg& name, int32_t defaultValue) = 0;
    virtual int64_t getInt64(const CStringArg& section, const CStringArg& name, int64_t defaultValue) = 0;
    virtual bool getBool(const CStringArg& section, const CStringArg& name, bool defaultValue) = 0;
    virtual double getDouble(const CStringArg& section, const CStringArg& name, double defaultValue) = 0;

    virtual bool hasValue(const CStringArg& section, const CStringArg& name) = 0;
    virtual bool hasSection(const CStringArg& section) = 0;

    virtual WEnum<IString> getValueNames(const CStringArg& section) = 0;
    virtual WEnum<IString> getSectionNames(const CStringArg& section) = 0; // one level

    // What is not there need not be removed.
    virtual void removeValue(const CStringArg& section, const CStringArg& name) = 0;
    virtual void removeSection(const CStringArg& section) = 0; // with everything in it

    // Saves what has changed. Throws CFileError with the changes kept and the old file as it was.
    virtual void flush() = 0;
};

} // namespace peru
