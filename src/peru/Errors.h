// The error tree of the foundation.
#pragma once

#include "peru/Exception.h"
#include "peru/strings/String.h"

#include <typeinfo>

namespace peru {

class IURI;

// The base class of all failures. An empty title becomes "Error", an empty description "Unspecified error".
class PERU_API CError : public CException {
    PERU_EXCEPTION(CError)
    explicit CError(const CStringArg& description, const CStringArg& title = "");
};

// --- Objects ---

// %OBJECTDESC% in the description is replaced by the object's description, or by "unknown object"; an empty
// description is the object's description alone.
class PERU_API CObjectError : public CError {
    PERU_EXCEPTION(CObjectError)
    CObjectError(const CStringArg& description, const P<IBase>& object, const std::type_info* type = nullptr,
                 const CStringArg& title = "");
    const P<IBase>& getObject() const { return m_object; }
    const std::type_info* getType() const { return m_type; }

protected:
    P<IBase> m_object;
    const std::type_info* m_type; // taken from the object if none was given
};

class PERU_API CCastError : public CObjectError {
    PERU_EXCEPTION(CCastError)
    CCastError(const P<IBase>& object, const std::type_info& source, const std::type_info& target);
};

class PERU_API CInvalidObjectStateError : public CObjectError {
    PERU_EXCEPTION(CInvalidObjectStateError)
    CInvalidObjectStateError(const CStringArg& detail, const P<IBase>& object);
};

class PERU_API CEndOfEnumError : public CInvalidObjectStateError {
    PERU_EXCEPTION(CEndOfEnumError)
    explicit CEndOfEnumError(const P<IBase>& object = nullptr);
};

class PERU_API CInvalidArgError : public CObjectError {
    PERU_EXCEPTION(CInvalidArgError)
    // An empty text appears as "unspecified method" or "unspecified argument".
    CInvalidArgError(const CStringArg& argument, const CStringArg& method, const P<IBase>& object = nullptr);
};

class PERU_API CMethodNotImplementedError : public CObjectError {
    PERU_EXCEPTION(CMethodNotImplementedError)
    CMethodNotImplementedError(const CStringArg& method, const P<IBase>& object = nullptr);
};

// --- General ---

class PERU_API CParseError : public CError {
    PERU_EXCEPTION(CParseError)
    explicit CParseError(const CStringArg& description);
};

class PERU_API CInvalidVolumeIDError : public CError {
    PERU_EXCEPTION(CInvalidVolumeIDError)
    explicit CInvalidVolumeIDError(const CStringArg& id);
};

class PERU_API CNoSuchObjectError : public CError {
    PERU_EXCEPTION(CNoSuchObjectError)
    CNoSuchObjectError();
};

class PERU_API CReadOnlyError : public CError {
    PERU_EXCEPTION(CReadOnlyError)
    explicit CReadOnlyError(const CStringArg& objectDescription);
};

class PERU_API CAbortedError : public CError {
    PERU_EXCEPTION(CAbortedError)
    CAbortedError();
};

class PERU_API CFinishedError : public CError {
    PERU_EXCEPTION(CFinishedError)
    CFinishedError();
};

// --- URIs and files ---

// %URI% in the description is replaced by the URI, or by "<uri unknown>".
class PERU_API CURIError : public CError {
    PERU_EXCEPTION(CURIError)
    CURIError(const CStringArg& description, const P<IURI>& uri, const CStringArg& title = "");
    const P<IURI>& getURI() const { return m_uri; }

protected:
    P<IURI> m_uri;
};

class PERU_API CURIFormatError : public CURIError {
    PERU_EXCEPTION(CURIFormatError)
    explicit CURIFormatError(const P<IURI>& uri = nullptr);
    // For a text that could not be parsed as a URI; it replaces %URI%.
    explicit CURIFormatError(const CStringArg& uriText);
};

class PERU_API CURITypeNotSupportedError : public CURIError {
    PERU_EXCEPTION(CURITypeNotSupportedError)
    explicit CURITypeNotSupportedError(const P<IURI>& uri = nullptr);
};

class PERU_API CFileError : public CURIError {
    PERU_EXCEPTION(CFileError)
    CFileError(const CStringArg& description, const P<IURI>& file, const CStringArg& title = "");
};

class PERU_API CFileNotFoundError : public CFileError {
    PERU_EXCEPTION(CFileNotFoundError)
    explicit CFileNotFoundError(const P<IURI>& file = nullptr);
};

class PERU_API CFileAccessDeniedError : public CFileError {
    PERU_EXCEPTION(CFileAccessDeniedError)
    explicit CFileAccessDeniedError(const P<IURI>& file);
};

class PERU_API CFileFormatNotSupportedError : public CFileError {
    PERU_EXCEPTION(CFileFormatNotSupportedError)
    explicit CFileFormatNotSupportedError(const P<IURI>& file = nullptr);
};

// --- Streams ---

class PERU_API CStreamError : public CURIError {
    PERU_EXCEPTION(CStreamError)
    CStreamError(const CStringArg& description, const P<IURI>& uri, const CStringArg& title = "");
};

class PERU_API CStreamClosedError : public CStreamError {
    PERU_EXCEPTION(CStreamClosedError)
    explicit CStreamClosedError(const P<IURI>& uri = nullptr);
};

class PERU_API CEndOfStreamError : public CStreamError {
    PERU_EXCEPTION(CEndOfStreamError)
    explicit CEndOfStreamError(const P<IURI>& uri = nullptr);
};

} // namespace peru
