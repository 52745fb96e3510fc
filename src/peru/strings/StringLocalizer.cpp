#include "peru/strings/StringLocalizer.h"

#include "peru/Errors.h"
#include "peru/GlobalObjFactory.h"
#include "peru/strings/StringText.h"

namespace peru {

CStringLocalizer::CStringLocalizer() = default;

CStringLocalizer::~CStringLocalizer() = default;

void CStringLocalizer::clear() {
    std::unique_lock lock(m_mutex);
    m_texts.clear();
}

void CStringLocalizer::setParent(const P<IStringLocalizer>& parent) {
    if (parent == P<IStringLocalizer>::share(this))
        throw CInvalidArgError("parent", "setParent", P<IBase>(P<CStringLocalizer>::share(this)));
    std::unique_lock lock(m_mutex);
    m_parent = parent;
}

void CStringLocalizer::setText(const CStringArg& key, const P<IString>& text) {
    const P<IString> ownKey = CString::fromView(key.getView());
    std::unique_lock lock(m_mutex);
    m_texts.set(ownKey, text);
}

P<IString> CStringLocalizer::getText(const CStringArg& key, const P<IString>& defaultText) {
    std::shared_lock lock(m_mutex);
    if (const P<IString>* own = findOwn(key)) return *own;
    return m_parent ? m_parent->getText(key, defaultText) : defaultText;
}

P<IString> CStringLocalizer::findText(const CStringArg& key) {
    std::shared_lock lock(m_mutex);
    if (const P<IString>* own = findOwn(key)) return *own;
    return m_parent ? m_parent->findText(key) : nullptr;
}

const P<IString>* CStringLocalizer::findOwn(const CStringArg& key) const {
    if (m_texts.getCount() == 0) return nullptr;
    const P<IString>* own = m_texts.find(text::getHash(key.getView()), key);
    return own && *own && (*own)->getDataSize() > 0 ? own : nullptr;
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
    P<IString> text = getStringLocalizer()->findText(key);
    if (!text) text = newString(defaultText);
    return fillPlaceholders(text, placeholders);
}

} // namespace peru
