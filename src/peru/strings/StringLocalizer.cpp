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
    if (own && *own && (*own)->getDataSize() > 0) return *own;
    return m_parent ? m_parent->getText(key, defaultText) : defaultText;
}

P<IStringLocalizer> getStringLocalizer() {
    static const CGlobalObjFactory::SKey key;
    return CGlobalObjFactory::get<IStringLocalizer>(
        key, []() -> P<IStringLocalizer> { return make<CStringLocalizer>(); });
}

P<IString> fillPlaceholders(const P<IString>& text, std::initializer_list<SPlaceholder> placeholders) {
    P<IString> filled;
    for (SStringPos done = kStringBegin;;) {
        const SPlaceholder* next = nullptr;
        SStringPos found;
        for (const SPlaceholder& each : placeholders) {
            const SStringPos at = text->find(each.name, done);
            if (!at.isFound() || (next && at.index >= found.index)) continue;
            next = &each;
            found = at;
        }
        const P<IString> part = !filled && !next ? text : text->substring(done, found);
        filled = filled ? filled + part : part;
        if (!next) return filled;
        filled = filled->concat(next->value);
        for (const char* c = next->name; *c; ++c) text->getCharAndAdvance(found);
        done = found;
    }
}

P<IString> localize(const char* key, const char* defaultText,
                    std::initializer_list<SPlaceholder> placeholders) {
    return fillPlaceholders(getStringLocalizer()->getText(key, newString(defaultText)), placeholders);
}

} // namespace peru
