#include "peru/Errors.h"
#include "peru/Rival.h"
#include "peru/collections/Array.h"
#include "peru/strings/StringLocalizer.h"
#include "peru/uri/URI.h"
#include "support/Files.h"

namespace peru {

namespace {

using tests::text;

template <class E> P<CException> error(const E& e) {
    return e.clone();
}

// Clears the process's localizer at the end of a test.
struct SLocalized {
    ~SLocalized() { getStringLocalizer()->clear(); }
};

} // namespace

TEST(Errors, ReadAsTheUserSeesThem) {
    P<IURI> uri = make<CURI>("file:///music/a%20b.wav");
    P<IURI> noURI;
    P<IBase> array = make<CArray>();
    const std::tuple<P<CException>, const char*, const char*> cases[] = {
        {error(CError("", "")), "Error", "Unspecified error"},
        {error(CError("broken", "Disc")), "Disc", "broken"},
        {error(CObjectError("lost %OBJECTDESC%, %OBJECTDESC%", array)), "Object error",
         "lost peru::CArray object, peru::CArray object"},
        {error(CObjectError("", array, nullptr, "Own")), "Own", "peru::CArray object"},
        {error(CInvalidObjectStateError("closed", array)), "Object error",
         "The object is in an invalid state (peru::CArray object): closed"},
        {error(CEndOfEnumError()), "Object error",
         "The object is in an invalid state (unknown object): end of enumeration already reached"},
        {error(CInvalidArgError("", "", array)), "Object error",
         "An invalid argument was passed to method 'unspecified method' of 'peru::CArray object': "
         "unspecified argument"},
        {error(CMethodNotImplementedError("")), "Object error",
         "Method not implemented (unknown object): unspecified method."},
        {error(CInvalidVolumeIDError("Q:")), "Invalid Volume ID Error", "Invalid volume id: Q:"},
        {error(CReadOnlyError("disc")), "Error", "The object (disc) is read-only and cannot be changed."},
        {error(CURIError("%URI%: gone", uri)), "Error", "file:///music/a%20b.wav: gone"},
        {error(CURIError("%URI%: gone", nullptr)), "Error", "<uri unknown>: gone"},
        {error(CURIFormatError(uri)), "Error", "The URI ('file:///music/a%20b.wav') has an invalid format."},
        {error(CURIFormatError(noURI)), "Error", "The URI has an invalid format."},
        {error(CURITypeNotSupportedError()), "Error", "This type URI is not supported."},
        {error(CFileNotFoundError()), "Error", "The file was not found."},
        {error(CFileAccessDeniedError(nullptr)), "Error",
         "The access of the file '<uri unknown>' was denied."},
        {error(CStreamClosedError(uri)), "Error",
         "The stream has been closed (uri: 'file:///music/a%20b.wav')."},
    };
    for (const auto& [thrown, title, description] : cases) {
        EXPECT_EQ(text(thrown->getTitle()), title) << description;
        EXPECT_EQ(text(thrown->getDescription()), description);
        EXPECT_STREQ(thrown->what(), description);
    }
}

TEST(Errors, FillPlaceholdersAfterLocalising) {
    SLocalized restore;
    getStringLocalizer()->setText("peru.CFileNotFoundError.Desc", newString("%FILE% fehlt; %FILE%"));
    getStringLocalizer()->setText("peru.CURIFormatError.Desc", newString("[%URI%]"));
    EXPECT_EQ(text(CFileNotFoundError(make<CURI>("file:///a")).getDescription()),
              "file:///a fehlt; file:///a");
    EXPECT_EQ(text(CURIFormatError("::").getDescription()), "[::]");
    // In one pass: values are not expanded, whatever they contain.
    EXPECT_EQ(text(CURIFormatError("%URI%").getDescription()), "[%URI%]");
    EXPECT_EQ(text(CFileError("%FILE% %URI%", make<CURI>("x:%URI%")).getDescription()), "x:%URI% x:%URI%");
    EXPECT_EQ(text(CInvalidArgError("%OBJECTDESC%", "m").getDescription()),
              "An invalid argument was passed to method 'm' of 'unknown object': %OBJECTDESC%");
    EXPECT_EQ(text(localize("", "%B%|%A%|%B%x", {{"%A%", "%B%"}, {"%B%", "%A%"}})), "%A%|%B%|%A%x");
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
    P<CException> second = parked; // must not affect the thrown copies
    for (int i = 0; i < 2; ++i) {
        try {
            parked->raise();
        } catch (CFileNotFoundError& caught) {
            EXPECT_EQ(caught.getURI(), uri);
            EXPECT_TRUE(tryCast<CFileNotFoundError>(caught.clone()));
        }
    }
    P<CException> condition = CException(newString("gone"), nullptr).clone();
    EXPECT_FALSE(tryCast<CError>(condition));
    EXPECT_THROW(condition->raise(), CException);
}

TEST(Exception, AnswersWhatFromTheCodePageOrTheThread) {
    P<IString> codePage = make<CCPString>("direct");
    CError direct(codePage);
    EXPECT_EQ(static_cast<const void*>(direct.what()), direct.getDescription()->getData());
    CException wide(make<CUTF16String>(u"converted"), nullptr);
    const char* here = wide.what();
    std::thread([] {
        EXPECT_STREQ(CException(make<CUTF16String>(u"elsewhere"), nullptr).what(), "elsewhere");
    }).join();
    EXPECT_STREQ(here, "converted");
    // A slice has no terminator of its own.
    CException slice(codePage->substring(kStringBegin, codePage->getPosition(3)), nullptr);
    EXPECT_STREQ(slice.what(), "dir");
}

// A parent that another localizer asks with its lock held.
class CParent : public CStringLocalizer {
public:
    P<IString> getText(const CStringArg& key, const P<IString>& defaultText) override {
        if (const auto call = m_onCall) call(); // a copy, since the call may replace it
        return CStringLocalizer::getText(key, defaultText);
    }
    std::function<void()> m_onCall;
};

TEST(StringLocalizer, EveryChange_WaitsForARunningLookUp) {
    const P<CParent> parent = make<CParent>();
    const P<IStringLocalizer> own = make<CStringLocalizer>();
    own->setParent(parent);
    tests::CRivals rivals;
    parent->m_onCall = [&] {
        parent->m_onCall = nullptr;
        rivals.expectBlocked({[&] { own->setText("a", newString("b")); }, [&] { own->setParent(nullptr); },
                              [&] { own->clear(); }});
    };
    EXPECT_EQ(text(own->getText("a", newString("default"))), "default");
}

TEST(StringLocalizer, PrefersOwnTextThenParentThenDefault) {
    P<IStringLocalizer> parent = make<CStringLocalizer>();
    P<IStringLocalizer> own = make<CStringLocalizer>();
    own->setParent(parent);
    auto look = [&] { return text(own->getText("a.b.c", newString("default"))); };
    EXPECT_EQ(look(), "default");
    parent->setText("a.b.c", newString("parent"));
    for (const char* entry : {"own", "", "again"}) {
        own->setText(u"a.b.c", newString(entry));
        EXPECT_EQ(look(), *entry ? entry : "parent");
    }
    own->clear();
    EXPECT_EQ(look(), "parent");
    own->setParent(nullptr);
    EXPECT_EQ(look(), "default");
    EXPECT_THROW(own->setParent(own), CInvalidArgError);
}

} // namespace peru
