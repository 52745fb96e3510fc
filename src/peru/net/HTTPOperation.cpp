#include "peru/net/HTTPOperation.h"

#include "peru/net/HTTPError.h"
#include "peru/strings/IStringLocalizer.h"

namespace peru::net {

CHTTPOperation::CHTTPOperation(const P<CHTTPRequest>& request, const SHTTPSettings& settings)
    : m_request(request), m_settings(settings) {
    start();
}

CHTTPOperation::~CHTTPOperation() {
    m_client->close(); // a stream that outlives the operation is closed
}

void CHTTPOperation::start() {
    P<INetEvent> cancel = createNetEvent();
    m_client = make<CHTTPClient>(m_request, m_settings, cancel, m_listeners);
    m_stream = make<CHTTPInStream>(m_client);
    std::lock_guard lock(m_mutex);
    m_cancel = std::move(cancel);
}

P<CHTTPResponse> CHTTPOperation::getResponse() const {
    const P<CHTTPResponse> response = m_client->getResponse();
    return response && response->isComplete() ? response : nullptr;
}

void CHTTPOperation::checkStatus() const {
    const P<CHTTPResponse> response = getResponse();
    if (response && response->getStatus() >= 400)
        throw CHTTPError(response->getStatus(), response->getReason(), getURI());
}

void CHTTPOperation::cancel() {
    std::lock_guard lock(m_mutex);
    m_cancel->set();
}

bool CHTTPOperation::isCancelled() const {
    std::lock_guard lock(m_mutex);
    return m_cancel->isSet();
}

void CHTTPOperation::reset() {
    m_request->rewindBody();
    m_client->close();
    start();
}

} // namespace peru::net
