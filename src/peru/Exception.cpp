#include "peru/Exception.h"

#include "peru/strings/String.h"

#include <utility>

namespace peru {

CException::CException(const P<IString>& description, const P<IString>& title)
    : m_title(title ? title : CString::empty()), m_description(description ? description : CString::empty()) {
}

// The language runtime owns thrown objects. Their count was copied from another object and means nothing; the
// reset satisfies the check in ~CReferencable.
CException::~CException() {
    resetCount();
}

namespace {

// The text that what() last returned on this thread. Destructors of static objects may call what() after the
// thread's storage has been destroyed.
struct SWhatText {
    P<IString> text;
    ~SWhatText();
};
thread_local bool t_whatTextGone = false;
thread_local SWhatText t_whatText;

SWhatText::~SWhatText() {
    t_whatTextGone = true;
}

} // namespace

const char* CException::what() const noexcept {
    try {
        if (m_description->isEncoding(ICharEncoding::kCodePage) && m_description->isTerminated())
            return reinterpret_cast<const char*>(m_description->getData());
        P<IString> converted = m_description->toCPString();
        if (!t_whatTextGone) {
            t_whatText.text = std::move(converted);
            return reinterpret_cast<const char*>(t_whatText.text->getData());
        }
    } catch (...) {
        // A failure here must not hide the one that is being described.
    }
    return "error without a readable description";
}

P<IString> CException::getTitle() const {
    return m_title;
}

P<IString> CException::getDescription() const {
    return m_description;
}

P<CException> CException::clone() const {
    auto* copy = new CException(*this);
    copy->resetCount();
    return P<CException>(copy);
}

void CException::raise() const {
    throw *this;
}

} // namespace peru
