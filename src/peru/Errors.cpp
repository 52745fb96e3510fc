#include "peru/Errors.h"

#include "peru/ClassName.h"
#include "peru/strings/IStringLocalizer.h"
#include "peru/uri/IURI.h"

namespace peru {

namespace {

// Text that cannot be decoded is not missing.
bool isMissing(const CStringArg& text) {
    return text.getByteSize() == 0;
}

// Copies the text into a new string of the same encoding.
P<IString> ownText(const CStringArg& text, const char* whenEmpty = "") {
    if (isMissing(text)) return newString(whenEmpty);
    auto* encoding = const_cast<ICharEncoding*>(&text.getEncoding());
    return make<CString>(P<ICharEncoding>::share(encoding), text.getData(), text.getByteSize());
}

P<IString> describe(const P<IBase>& object) {
    return object ? object->getObjectDesc() : localize("peru.unknownObject", "unknown object");
}

P<IString> uriText(const P<IURI>& uri) {
    P<IString> text = uri ? uri->getAsString() : nullptr;
    return text && !text->isEmpty() ? text : localize("peru.unknownURI", "<uri unknown>");
}

P<IString> withObject(const CStringArg& description, const P<IBase>& object) {
    if (isMissing(description)) return describe(object);
    return ownText(description)->replace("%OBJECTDESC%", describe(object));
}

// One text for a known URI and another for an unknown one.
P<IString> byURI(const P<IURI>& uri, const char* key, const char* text, const char* generalKey,
                 const char* generalText) {
    return uri ? localize(key, text) : localize(generalKey, generalText);
}

// The text, or the second one if it is missing.
P<IString> orText(const CStringArg& text, const char* key, const char* otherwise) {
    return isMissing(text) ? localize(key, otherwise) : ownText(text);
}

P<IString> orTitle(const CStringArg& title) {
    return orText(title, "peru.CObjectError.Title", "Object error");
}

} // namespace

PERU_EXCEPTION_IMPL(CError)
CError::CError(const CStringArg& description, const CStringArg& title)
    : CException(ownText(description, "Unspecified error"), ownText(title, "Error")) {}

PERU_EXCEPTION_IMPL(CObjectError)
CObjectError::CObjectError(const CStringArg& description, const P<IBase>& object, const std::type_info* type,
                           const CStringArg& title)
    : CError(withObject(description, object), orTitle(title)), m_object(object), m_type(type) {
    if (!m_type && object) {
        const IBase& known = *object;
        m_type = &typeid(known);
    }
}

PERU_EXCEPTION_IMPL(CCastError)
CCastError::CCastError(const P<IBase>& object, const std::type_info& source, const std::type_info& target)
    : CObjectError("", object, &source, localize("peru.CCastError.Title", "Cast error")) {
    m_description =
        localize("peru.CCastError.Desc", "Error casting a '%SOURCE%' object to '%TARGET%'",
                 {{"%SOURCE%", getClassName(source).c_str()}, {"%TARGET%", getClassName(target).c_str()}});
}

// From here on, constructors with values in their text set the description themselves: a value that happens
// to contain a placeholder of a base class must not be expanded there.

PERU_EXCEPTION_IMPL(CInvalidObjectStateError)
CInvalidObjectStateError::CInvalidObjectStateError(const CStringArg& detail, const P<IBase>& object)
    : CObjectError("", object) {
    m_description = localize("peru.CInvalidObjectStateError.Desc",
                             "The object is in an invalid state (%OBJECTDESC%): %DETAIL%",
                             {{"%OBJECTDESC%", describe(object)}, {"%DETAIL%", detail}});
}

PERU_EXCEPTION_IMPL(CEndOfEnumError)
CEndOfEnumError::CEndOfEnumError(const P<IBase>& object)
    : CInvalidObjectStateError(localize("peru.CEndOfEnumError.desc", "end of enumeration already reached"),
                               object) {}

PERU_EXCEPTION_IMPL(CInvalidArgError)
CInvalidArgError::CInvalidArgError(const CStringArg& argument, const CStringArg& method,
                                   const P<IBase>& object)
    : CObjectError("", object) {
    m_description = localize(
        "peru.CInvalidArgError.Desc",
        "An invalid argument was passed to method '%METHOD%' of '%OBJECTDESC%': %ARGUMENT%",
        {{"%METHOD%", orText(method, "peru.CInvalidArgError.Method", "unspecified method")},
         {"%OBJECTDESC%", describe(object)},
         {"%ARGUMENT%", orText(argument, "peru.CInvalidArgError.Argument", "unspecified argument")}});
}

PERU_EXCEPTION_IMPL(CMethodNotImplementedError)
CMethodNotImplementedError::CMethodNotImplementedError(const CStringArg& method, const P<IBase>& object)
    : CObjectError("", object) {
    m_description = localize(
        "peru.CMethodNotImplementedError.Desc", "Method not implemented (%OBJECTDESC%): %METHOD%",
        {{"%OBJECTDESC%", describe(object)},
         {"%METHOD%", orText(method, "peru.CMethodNotImplementedError.Method", "unspecified method.")}});
}

PERU_EXCEPTION_IMPL(CParseError)
CParseError::CParseError(const CStringArg& description)
    : CError(description, localize("peru.CParseError.Title", "Parse error")) {}

PERU_EXCEPTION_IMPL(CInvalidVolumeIDError)
CInvalidVolumeIDError::CInvalidVolumeIDError(const CStringArg& id)
    : CError(localize("peru.CInvalidVolumeIDError.Desc", "Invalid volume id: %ID%", {{"%ID%", id}}),
             localize("peru.CInvalidVolumeIDError.Title", "Invalid Volume ID Error")) {}

PERU_EXCEPTION_IMPL(CNoSuchObjectError)
CNoSuchObjectError::CNoSuchObjectError()
    : CError(localize("peru.CNoSuchObjectError.desc", "No such object.")) {}

PERU_EXCEPTION_IMPL(CReadOnlyError)
CReadOnlyError::CReadOnlyError(const CStringArg& objectDescription)
    : CError(localize("peru.readOnlyErrorObjectDesc",
                      "The object (%DESC%) is read-only and cannot be changed.",
                      {{"%DESC%", objectDescription}})) {}

PERU_EXCEPTION_IMPL(CAbortedError)
CAbortedError::CAbortedError() : CError("") {}

PERU_EXCEPTION_IMPL(CFinishedError)
CFinishedError::CFinishedError() : CError("") {}

PERU_EXCEPTION_IMPL(CURIError)
CURIError::CURIError(const CStringArg& description, const P<IURI>& uri, const CStringArg& title)
    : CError(ownText(description)->replace("%URI%", uriText(uri)), title), m_uri(uri) {}

PERU_EXCEPTION_IMPL(CURIFormatError)
CURIFormatError::CURIFormatError(const P<IURI>& uri)
    : CURIError(byURI(uri, "peru.CURIFormatError.Desc", "The URI ('%URI%') has an invalid format.",
                      "peru.CURIFormatError.GeneralDesc", "The URI has an invalid format."),
                uri) {}
CURIFormatError::CURIFormatError(const CStringArg& uriText) : CURIError("", nullptr) {
    m_description = localize("peru.CURIFormatError.Desc", "The URI ('%URI%') has an invalid format.",
                             {{"%URI%", uriText}});
}

PERU_EXCEPTION_IMPL(CURITypeNotSupportedError)
CURITypeNotSupportedError::CURITypeNotSupportedError(const P<IURI>& uri)
    : CURIError(byURI(uri, "peru.CURITypeNotSupportedError.Desc",
                      "This type of URI ('%URI%') is not supported.",
                      "peru.CURITypeNotSupportedError.GeneralDesc", "This type URI is not supported."),
                uri) {}

PERU_EXCEPTION_IMPL(CFileError)
CFileError::CFileError(const CStringArg& description, const P<IURI>& file, const CStringArg& title)
    : CURIError(description, file, title) {
    if (!isMissing(description))
        m_description =
            fillPlaceholders(ownText(description), {{"%FILE%", uriText(file)}, {"%URI%", uriText(file)}});
}

PERU_EXCEPTION_IMPL(CFileNotFoundError)
CFileNotFoundError::CFileNotFoundError(const P<IURI>& file)
    : CFileError(byURI(file, "peru.CFileNotFoundError.Desc", "The file '%FILE%' was not found.",
                       "peru.CFileNotFoundError.GeneralDesc", "The file was not found."),
                 file) {}

PERU_EXCEPTION_IMPL(CFileAccessDeniedError)
CFileAccessDeniedError::CFileAccessDeniedError(const P<IURI>& file)
    : CFileError(localize("peru.CFileAccessDeniedError.Desc", "The access of the file '%FILE%' was denied."),
                 file) {}

PERU_EXCEPTION_IMPL(CFileFormatNotSupportedError)
CFileFormatNotSupportedError::CFileFormatNotSupportedError(const P<IURI>& file)
    : CFileError(byURI(file, "peru.CFileFormatNotSupportedError.Desc",
                       "The format of file '%FILE%' is not supported.",
                       "peru.CFileFormatNotSupportedError.Desc.FileUnknown",
                       "The file format is not supported."),
                 file) {}

PERU_EXCEPTION_IMPL(CStreamError)
CStreamError::CStreamError(const CStringArg& description, const P<IURI>& uri, const CStringArg& title)
    : CURIError(description, uri, title) {}

PERU_EXCEPTION_IMPL(CStreamClosedError)
CStreamClosedError::CStreamClosedError(const P<IURI>& uri) : CStreamError("", uri) {
    m_description =
        uri ? localize("peru.CStreamClosedError.Desc", "The stream has been closed (uri: '%URI%').",
                       {{"%URI%", uri->getAsString()}})
            : localize("peru.CStreamClosedError.GeneralDesc", "The stream has been closed.");
}

PERU_EXCEPTION_IMPL(CEndOfStreamError)
CEndOfStreamError::CEndOfStreamError(const P<IURI>& uri) : CStreamError("", uri) {
    m_description =
        uri ? localize("peru.CEndOfStreamError.Desc", "Unexpected end of data stream (uri: '%URI%').",
                       {{"%URI%", uri->getAsString()}})
            : localize("peru.CEndOfStreamError.GeneralDesc", "Unexpected end of data stream.");
}

} // namespace peru
