// Named typed values in sections: settings.
#pragma once

#include "peru/collections/IEnum.h"
#include "peru/strings/IString.h"

namespace peru {

// A section is a path of names separated by "/"; an empty path is the top level. Not thread-safe.
//
// Changes are kept in memory until flush(), unless the store saves automatically. They throw CReadOnlyError
// if the store was opened for reading, CInvalidArgError for names and texts that the store cannot hold, and
// CFileError if saving them automatically fails.
class PERU_API IValueStore : public virtual IBase {
public:
    virtual void setString(const CStringArg& section, const CStringArg& name, const CStringArg& value) = 0;
    virtual void setInt(const CStringArg& section, const CStringArg& name, int32_t value) = 0;
    virtual void setInt64(const CStringArg& section, const CStringArg& name, int64_t value) = 0;
    virtual void setBool(const CStringArg& section, const CStringArg& name, bool value) = 0;
    virtual void setDouble(const CStringArg& section, const CStringArg& name, double value) = 0;

    // All return the default if there is no value or its text is empty. The three numeric operations throw
    // CParseError for text that is not a number; getBool returns the default for text other than "true" and
    // "false".
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

    // Removing something that does not exist does nothing.
    virtual void removeValue(const CStringArg& section, const CStringArg& name) = 0;
    virtual void removeSection(const CStringArg& section) = 0; // with everything in it

    // Saves the changes. On CFileError the changes are kept and the old file is unchanged.
    virtual void flush() = 0;
};

} // namespace peru
