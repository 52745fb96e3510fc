#include "zvr_lang_manager/LanguageLog.h"

#include "peru/log/ILog.h"
#include "peru/strings/StringFormat.h"
#include "peru/system/IPathes.h"

namespace zvr_lang {

void logLoadError(const peru::P<peru::IURI>& uri, const std::exception& error) {
    const auto* known = dynamic_cast<const peru::CException*>(&error);
    const peru::P<peru::IString> reason =
        known ? known->getDescription() : peru::CString::fromUTF8(error.what());
    peru::getLogManager()->warning(peru::newString(kLogComponent),
                                   peru::format("error while loading '%s'", peru::getShownName(uri)),
                                   {reason});
}

} // namespace zvr_lang
