#include "peru/strings/StringLocalizer.h"

#include "peru/Errors.h"
#include "peru/GlobalObjFactory.h"

namespace peru {

namespace {

P<ICharEncoding> getEncoding(const CStringArg& text) {
    return P<ICharEncoding>::share(const_cast<ICharEncoding*>(&text.getEncoding()));
}

} // namespace

CStringLocalizer::CStringLocalizer() : m_mutex(getMutexFactory()->createMutex()) {}

CStringLocalizer::~CStringLocalizer() = default;

void CStringLocalizer::clear() {
    CMutexLock lock(m_mutex);
    m_texts.clear();
}

void CStringLocalizer::setParent(const P<IStringLocalizer>& parent) {
    if (parent == P<IStringLocalizer>::share(this))
        throw CInvalidArgError("parent", "setParent", P<IBase>(P<CStringLocalizer>::share(this)));
    CMutexLock lock(m_mutex);
    m_parent = parent;
}

void CStringLocalizer::setText(const CStringArg& key, const P<IString>& text) {
    auto ownKey = make<CString>(getEncoding(key), key.getData(), key.getByteSize());
    CMutexLock lock(m_mutex);
    m_texts.set(ownKey, text);
}

P<IString> CStringLocalizer::getText(const CStringArg& key, const P<IString>& defaultText) {
    const CString wanted(getEncoding(key), key.getData(), key.getByteSize(), EStringStorage::refer);
    CMutexLock lock(m_mutex);
    const P<IString>* own = m_texts.find(wanted);
    if (own && *own && !(*own)->isEmpty()) return *own;
    return m_parent ? m_parent->getText(key, defaultText) : defaultText;
}

P<IStringLocalizer> getStringLocalizer() {
    static const CGlobalObjFactory::SKey key;
    return CGlobalObjFactory::get<IStringLocalizer>(
        key, []() -> P<IStringLocalizer> { return make<CStringLocalizer>(); });
}

P<IString> localize(const char* key, const char* defaultText,
                    std::initializer_list<SPlaceholder> placeholders) {
    P<IString> text = getStringLocalizer()->getText(key, newString(defaultText));
    for (const SPlaceholder& placeholder : placeholders)
        text = text->replace(placeholder.name, placeholder.value);
    return text;
}

} // namespace peru
