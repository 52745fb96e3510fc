#include "peru/Errors.h"
#include "peru/Array.h"
#include "peru/StringLocalizer.h"
#include "peru/URI.h"

#include <gtest/gtest.h>

#include <exception>
#include <functional>
#include <memory>
#include <thread>

namespace peru {

namespace {

std::string text(const CStringArg& string) {
    return CString::toStdString(string);
}

template <class E> std::shared_ptr<CException> error(E&& e) {
    return std::make_shared<std::decay_t<E>>(std::forward<E>(e));
}

// Texts of the process's localizer for the length of a test.
struct SLocalized {
    ~SLocalized() { getStringLocalizer()->clear(); }
};

} // namespace

TEST(Errors, ReadAsTheUserSeesThem) {
    P<IURI> uri = make<CURI>("file:///music/a%20b.wav");
    P<IURI> noURI;
    P<IBase> array = make<CArray>();
    const struct {
        std::shared_ptr<CException> error;
        const char* title;
        const char* description;
    } cases[] = {
        {error(CError("", "")), "Error", "Unspecified error"},
        {error(CError("broken", "Disc")), "Disc", "broken"},
        {error(CObjectError("lost %OBJECTDESC%, %OBJECTDESC%", array)), "Object error",
         "lost peru::CArray object, peru::CArray object"},
        {error(CObjectError("lost %OBJECTDESC%", nullptr)), "Object error", "lost unknown object"},
        {error(CObjectError("", array, nullptr, "Own")), "Own", "peru::CArray object"},
        {error(CInvalidObjectStateError("closed", array)), "Object error",
         "The object is in an invalid state (peru::CArray object): closed"},
        {error(CEndOfEnumError()), "Object error",
         "The object is in an invalid state (unknown object): end of enumeration already reached"},
        {error(CInvalidArgError("", "", array)), "Object error",
         "An invalid argument was passed to method 'unspecified method' of 'peru::CArray object': "
         "unspecified argument"},
        {error(CInvalidArgError("index", "getAt")), "Object error",
         "An invalid argument was passed to method 'getAt' of 'unknown object': index"},
        {error(CMethodNotImplementedError("")), "Object error",
         "Method not implemented (unknown object): unspecified method."},
        {error(CMethodNotImplementedError("seek", array)), "Object error",
         "Method not implemented (peru::CArray object): seek"},
        {error(CParseError("Error parsing integer.")), "Parse error", "Error parsing integer."},
        {error(CInvalidVolumeIDError("Q:")), "Invalid Volume ID Error", "Invalid volume id: Q:"},
        {error(CNoSuchObjectError()), "Error", "No such object."},
        {error(CReadOnlyError("disc")), "Error", "The object (disc) is read-only and cannot be changed."},
        {error(CAbortedError()), "Error", "Unspecified error"},
        {error(CFinishedError()), "Error", "Unspecified error"},
        {error(CURIError("%URI%: gone", uri)), "Error", "file:///music/a%20b.wav: gone"},
        {error(CURIError("%URI%: gone", nullptr)), "Error", "<uri unknown>: gone"},
        {error(CURIFormatError(uri)), "Error", "The URI ('file:///music/a%20b.wav') has an invalid format."},
        {error(CURIFormatError(noURI)), "Error", "The URI has an invalid format."},
        {error(CURIFormatError("a b")), "Error", "The URI ('a b') has an invalid format."},
        {error(CURITypeNotSupportedError(uri)), "Error",
         "This type of URI ('file:///music/a%20b.wav') is not supported."},
        {error(CURITypeNotSupportedError()), "Error", "This type URI is not supported."},
        {error(CFileNotFoundError(uri)), "Error", "The file 'file:///music/a%20b.wav' was not found."},
        {error(CFileNotFoundError()), "Error", "The file was not found."},
        {error(CFileAccessDeniedError(uri)), "Error",
         "The access of the file 'file:///music/a%20b.wav' was denied."},
        {error(CFileAccessDeniedError(nullptr)), "Error",
         "The access of the file '<uri unknown>' was denied."},
        {error(CFileFormatNotSupportedError(uri)), "Error",
         "The format of file 'file:///music/a%20b.wav' is not supported."},
        {error(CFileFormatNotSupportedError()), "Error", "The file format is not supported."},
        {error(CStreamClosedError()), "Error", "The stream has been closed."},
        {error(CStreamClosedError(uri)), "Error",
         "The stream has been closed (uri: 'file:///music/a%20b.wav')."},
        {error(CEndOfStreamError()), "Error", "Unexpected end of data stream."},
        {error(CEndOfStreamError(uri)), "Error",
         "Unexpected end of data stream (uri: 'file:///music/a%20b.wav')."},
    };
    for (const auto& each : cases) {
        EXPECT_EQ(text(each.error->getTitle()), each.title) << each.description;
        EXPECT_EQ(text(each.error->getDescription()), each.description);
        EXPECT_STREQ(each.error->what(), each.description);
    }
}

TEST(Errors, FillPlaceholdersAfterLocalising) {
    SLocalized restore;
    const std::pair<const char*, const char*> texts[] = {
        {"peru.CFileNotFoundError.Desc", "%FILE% fehlt; %FILE%"},
        {"peru.CFileNotFoundError.GeneralDesc", "Datei fehlt"},
        {"peru.CURIFormatError.Desc", "[%URI%]"},
        {"peru.CEndOfEnumError.desc", "zu Ende"},
        {"peru.readOnlyErrorObjectDesc", "%DESC%: nur lesbar"},
    };
    for (const auto& [key, value] : texts) getStringLocalizer()->setText(key, newString(value));
    P<IURI> uri = make<CURI>("file:///a");
    EXPECT_EQ(text(CFileNotFoundError(uri).getDescription()), "file:///a fehlt; file:///a");
    EXPECT_EQ(text(CFileNotFoundError().getDescription()), "Datei fehlt");
    EXPECT_EQ(text(CURIFormatError("::").getDescription()), "[::]");
    EXPECT_EQ(text(CEndOfEnumError().getDescription()),
              "The object is in an invalid state (unknown object): zu Ende");
    EXPECT_EQ(text(CReadOnlyError("x").getDescription()), "x: nur lesbar");
}

TEST(Errors, TakeTheTypeFromTheObjectUnlessItIsGiven) {
    P<IBase> array = make<CArray>();
    EXPECT_EQ(*CObjectError("", array).getType(), typeid(CArray));
    EXPECT_EQ(*CObjectError("", array, &typeid(int)).getType(), typeid(int));
    EXPECT_EQ(CObjectError("", nullptr).getType(), nullptr);
}

TEST(Exception, CrossesThreadsWithItsOwnType) {
    P<IURI> uri = make<CURI>("file:///gone");
    P<CException> parked;
    std::thread([&] {
        try {
            throw CFileNotFoundError(uri);
        } catch (const CException& caught) {
            parked = caught.clone();
        }
    }).join();
    // A second owner must not show in the copies that are thrown.
    P<CException> second = parked;
    for (int i = 0; i < 2; ++i) {
        try {
            parked->raise();
        } catch (CFileNotFoundError& caught) {
            EXPECT_EQ(caught.getURI(), uri);
            P<CException> again = caught.clone();
            EXPECT_TRUE(tryCast<CFileNotFoundError>(again));
        }
    }
    P<CException> condition = CException(newString("gone"), nullptr).clone();
    EXPECT_FALSE(tryCast<CError>(condition));
    EXPECT_THROW(condition->raise(), CException);
    EXPECT_TRUE(condition->getTitle()->isEmpty());
}

TEST(Exception, IsHeldByTheStandardMeansToo) {
    std::exception_ptr held;
    try {
        throw CParseError("Error parsing hex data.");
    } catch (...) {
        held = std::current_exception();
    }
    try {
        std::rethrow_exception(held);
    } catch (const std::exception& caught) {
        EXPECT_STREQ(caught.what(), "Error parsing hex data.");
    }
}

TEST(Exception, AnswersWhatFromTheCodePageOrTheThread) {
    P<IString> codePage = make<CCPString>("direct");
    CException direct(codePage, nullptr);
    EXPECT_EQ(static_cast<const void*>(direct.what()), codePage->getData());
    CError keptEncoding(codePage);
    EXPECT_EQ(static_cast<const void*>(keptEncoding.what()), keptEncoding.getDescription()->getData());

    CException wide(make<CUTF16String>(u"converted"), nullptr);
    const char* here = wide.what();
    std::thread([] {
        CException other(make<CUTF16String>(u"elsewhere"), nullptr);
        EXPECT_STREQ(other.what(), "elsewhere");
    }).join();
    EXPECT_STREQ(here, "converted");
    // A part of a string has no terminator of its own.
    CException slice(codePage->substring(kStringBegin, codePage->getPosition(3)), nullptr);
    EXPECT_STREQ(slice.what(), "dir");
}

TEST(StringLocalizer, PrefersOwnTextThenParentThenDefault) {
    P<IStringLocalizer> parent = make<CStringLocalizer>();
    P<IStringLocalizer> own = make<CStringLocalizer>();
    own->setParent(parent);
    auto look = [&](const char* key) { return text(own->getText(key, newString("default"))); };
    EXPECT_EQ(look("a.b.c"), "default");
    parent->setText("a.b.c", newString("parent"));
    EXPECT_EQ(look("a.b.c"), "parent");
    own->setText(u"a.b.c", newString("own"));
    EXPECT_EQ(look("a.b.c"), "own");
    own->setText("a.b.c", newString(""));
    EXPECT_EQ(look("a.b.c"), "parent");
    own->setText("a.b.c", newString("own"));
    own->clear();
    EXPECT_EQ(look("a.b.c"), "parent");
    own->setParent(nullptr);
    EXPECT_EQ(look("a.b.c"), "default");
    EXPECT_THROW(own->setParent(own), CInvalidArgError);
}

} // namespace peru
