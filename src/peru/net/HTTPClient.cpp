#include "peru/net/HTTPClient.h"

#include "peru/net/HTTPError.h"
#include "peru/net/SocketError.h"
#include "peru/strings/IStringLocalizer.h"
#include "peru/strings/StringFormat.h"

#include <algorithm>
#include <array>
#include <cerrno>

namespace peru::net {

namespace {

constexpr size_t kBlock = 64 * 1024;

// 0 means no limit. Seven weeks serve as well and, unlike an empty value, can also mark that silence has
// begun.
std::optional<std::chrono::steady_clock::time_point> endAfter(uint32_t milliseconds) {
    if (milliseconds == 0) milliseconds = UINT32_MAX;
    return std::chrono::steady_clock::now() + std::chrono::milliseconds(milliseconds);
}

} // namespace

CHTTPClient::CHTTPClient(const P<CHTTPRequest>& request, const SHTTPSettings& settings,
                         const P<INetEvent>& cancel, const P<TFrailArray<IHTTPListener>>& listeners)
    : m_request(request), m_settings(settings), m_cancel(cancel), m_listeners(listeners) {
    if (!request) throw CInvalidArgError("request", "CHTTPClient");
}

CHTTPClient::~CHTTPClient() = default;

bool CHTTPClient::advance(bool wait) {
    try {
        checkUsable();
        while (m_step < EHTTPStep::receiveBody) {
            checkUsable();
            if (runStep(wait)) continue;
            checkUsable();
            checkTimes();
            if (!wait) return false;
        }
    } catch (...) {
        close();
        throw;
    }
    return true;
}

// Returns false if the step has to wait.
bool CHTTPClient::runStep(bool wait) {
    const SNetWait limits = getWait(wait);
    switch (m_step) {
    case EHTTPStep::chooseTarget:
        return chooseTarget(limits);
    case EHTTPStep::resolve:
        return resolve(limits);
    case EHTTPStep::startConnection:
        startConnection();
        return true;
    case EHTTPStep::connect:
        if (!m_connection->isConnected(limits)) return false;
        startRequest();
        return true;
    case EHTTPStep::sendRequest:
        return sendRequest(limits);
    default:
        return receiveHead(limits);
    }
}

bool CHTTPClient::chooseTarget(const SNetWait& wait) {
    if (!m_proxyLookUp) {
        if (!m_totalEnd) m_totalEnd = endAfter(m_settings.totalTimeout);
        m_stepEnd = endAfter(m_settings.connectTimeout);
        const P<IProxyManager> proxies = m_settings.proxies ? m_settings.proxies : getProxyManager();
        m_proxyLookUp = proxies->startLookUp(getURI());
    }
    if (!m_proxyLookUp->isDone(wait)) return false;
    m_proxy = m_proxyLookUp->getProxy();
    m_proxyLookUp.reset();
    m_resolution = getNetNameResolverManager()->start(m_proxy ? m_proxy : getURI());
    enter(EHTTPStep::resolve);
    return true;
}

bool CHTTPClient::resolve(const SNetWait& wait) {
    if (!m_resolution->isDone(wait)) return false;
    if (m_resolution->getAddresses().empty())
        throw CURIError(localize("peru.CHTTPClient.AdressNotFound", "The adress %URI% could'nt be resolved."),
                        m_proxy ? m_proxy : getURI());
    enter(EHTTPStep::startConnection);
    return true;
}

void CHTTPClient::startConnection() {
    m_connection = getConnectionManager()->start(m_resolution->getAddresses());
    m_resolution.reset();
    enter(EHTTPStep::connect);
}

void CHTTPClient::startRequest() {
    m_in = m_connection->getInStream();
    m_out = m_connection->getOutStream();
    SHTTPRequestHead head = composeRequestHead(*m_request, m_proxy);
    m_output = std::move(head.bytes);
    m_bodyToSend = head.bodySize;
    m_sent = 0;
    m_sendError = 0;
    m_stepEnd.reset();
    m_silenceEnd.reset();
    enter(EHTTPStep::sendRequest);
}

// Fills the empty output with the next part of the body; false at its end.
bool CHTTPClient::fillOutput() {
    if (m_bodyToSend == 0) return false;
    const bool chunked = m_bodyToSend < 0;
    const int64_t size =
        chunked ? static_cast<int64_t>(kBlock) : std::min(m_bodyToSend, static_cast<int64_t>(kBlock));
    std::string block(static_cast<size_t>(size), '\0');
    const int64_t count = m_request->getBody()->readSome(block.data(), size);
    if (count <= 0 && !chunked) throw CEndOfStreamError(m_request->getBody()->getURI());
    block.resize(static_cast<size_t>(std::max<int64_t>(count, 0)));
    m_sent = 0;
    if (!chunked) {
        m_bodyToSend -= count;
        m_output = std::move(block);
        return true;
    }
    m_output = CString::toStdString(format("%x\r\n", static_cast<uint32_t>(block.size()))) + block + "\r\n";
    if (block.empty()) m_bodyToSend = 0;
    return true;
}

bool CHTTPClient::sendRequest(const SNetWait& wait) {
    try {
        for (;;) {
            if (m_sent == m_output.size() && !fillOutput()) break;
            const int64_t count =
                m_out->tryWrite(m_output.data() + m_sent, static_cast<int64_t>(m_output.size() - m_sent));
            m_sent += static_cast<size_t>(count);
            if (count > 0) {
                m_silenceEnd.reset();
            } else if (!m_silenceEnd) {
                m_silenceEnd = endAfter(m_settings.silenceTimeout);
                return false; // the next wait takes the new limit into account
            } else if (!m_out->isWritable(wait)) {
                return false;
            }
            // A cancel and the time limit end a long body, too.
            if (m_cancel && m_cancel->isSet()) return false;
            checkTimes();
        }
    } catch (const CSocketError& error) {
        // A server that does not want the rest of the body may have answered before it closed.
        if (error.getCode() != ECONNRESET && error.getCode() != EPIPE) throw;
        m_sendError = error.getCode();
    }
    m_output.clear();
    m_silenceEnd.reset();
    m_stepEnd = endAfter(m_settings.silenceTimeout);
    m_response = make<CHTTPResponse>(m_settings.maxHeadSize);
    enter(EHTTPStep::receiveHead);
    return true;
}

bool CHTTPClient::receiveHead(const SNetWait& wait) {
    std::array<char, 16 * 1024> block; // not initialised: this runs with every poll
    std::optional<int64_t> count;
    try {
        count = m_in->tryRead(block.data(), static_cast<int64_t>(block.size()));
    } catch (const CSocketError&) {
        if (m_sendError != 0) throw CSocketError(m_sendError);
        throw;
    }
    if (!count) return wait.milliseconds != 0 && m_in->isReadable(wait);
    if (*count == 0) {
        if (m_response->hasBytes()) throw makeIllegalResponseError();
        throw CSocketError(m_sendError != 0 ? m_sendError : ECONNRESET);
    }
    if (m_response->parse({block.data(), static_cast<size_t>(*count)})) finishHead();
    return true;
}

void CHTTPClient::finishHead() {
    m_stepEnd.reset();
    if (m_settings.followRedirections)
        if (const P<IURI> uri = m_response->getRedirection(getURI())) {
            redirect(uri);
            return;
        }
    m_bodyMode = m_response->getBodyMode(m_request->getMethod());
    m_bodySize = m_bodyMode == EHTTPBody::none     ? 0
                 : m_bodyMode == EHTTPBody::length ? m_response->getContentLength()
                                                   : -1;
    if (m_settings.maxBodySize > 0 && m_bodySize > m_settings.maxBodySize)
        throw CStreamError(localize("peru.net.CHTTPClient.BodyTooLarge",
                                    "The response of '%URI%' is larger than permitted."),
                           getURI());
    if (m_bodyMode == EHTTPBody::chunked) m_decoder.emplace(m_settings.maxHeadSize);
    m_input = m_response->takeRest();
    m_inputStart = 0;
    m_inputEnd = m_input.size();
    m_received = 0;
    enter(EHTTPStep::receiveBody);
    if (m_bodySize == 0) finishBody();
}

void CHTTPClient::redirect(const P<IURI>& uri) {
    if (m_settings.maxRedirections != 0 && m_redirections >= m_settings.maxRedirections)
        throw CURIError(localize("peru.net.CHTTPClient.TooManyRedirections",
                                 "The address '%URI%' was redirected too often."),
                        getURI());
    ++m_redirections;
    disconnect();
    P<CHTTPRequest> next = m_request->redirect(uri, m_response->getStatus() == 303);
    next->rewindBody();
    m_request = std::move(next);
    m_response.reset();
    enter(EHTTPStep::chooseTarget);
}

std::optional<int64_t> CHTTPClient::readBody(void* buffer, int64_t size, bool wait) {
    if (size <= 0) throw CInvalidArgError("size", "CHTTPClient::readBody");
    if (!advance(wait)) return std::nullopt;
    if (m_step == EHTTPStep::done) return 0;
    try {
        for (;;) {
            checkUsable();
            const std::optional<int64_t> count =
                readDecoded(static_cast<char*>(buffer), static_cast<size_t>(size), getWait(wait));
            if (count) {
                m_silenceEnd.reset();
                checkTimes();
                m_received += *count;
                if (m_settings.maxBodySize > 0 && m_received > m_settings.maxBodySize)
                    throw CStreamError(localize("peru.net.CHTTPClient.BodyTooLarge",
                                                "The response of '%URI%' is larger than permitted."),
                                       getURI());
                if (*count > 0) notify();
                const bool atEnd = m_decoder ? m_decoder->isAtEnd() : m_received == m_bodySize;
                if (*count == 0 || atEnd) finishBody();
                return count;
            }
            checkUsable();
            checkTimes();
            if (!wait) return std::nullopt;
        }
    } catch (...) {
        close();
        throw;
    }
}

std::optional<int64_t> CHTTPClient::readDecoded(char* buffer, size_t size, const SNetWait& wait) {
    if (m_bodyMode == EHTTPBody::chunked) return readChunked(buffer, size, wait);
    if (m_bodyMode == EHTTPBody::length)
        size = static_cast<size_t>(std::min(static_cast<int64_t>(size), m_bodySize - m_received));
    const std::optional<int64_t> count = readRaw(buffer, size, wait);
    if (count == 0 && m_bodyMode == EHTTPBody::length) throw CEndOfStreamError(getURI());
    return count;
}

std::optional<int64_t> CHTTPClient::readChunked(char* buffer, size_t size, const SNetWait& wait) {
    for (;;) {
        const std::string_view input(m_input.data() + m_inputStart, m_inputEnd - m_inputStart);
        std::string_view bytes = input;
        const size_t count = m_decoder->decode(bytes, buffer, size);
        m_inputStart += input.size() - bytes.size();
        if (count > 0 || m_decoder->isAtEnd()) return static_cast<int64_t>(count);
        // All input is used up, since the buffer is not full.
        if (m_input.size() < kBlock) m_input.resize(kBlock);
        m_inputStart = m_inputEnd = 0;
        const std::optional<int64_t> received = receive(m_input.data(), m_input.size(), wait);
        m_inputEnd = static_cast<size_t>(received.value_or(0));
        if (!received) return std::nullopt;
        if (*received == 0) throw CEndOfStreamError(getURI());
        m_silenceEnd.reset();
        // A server may send nothing but size lines.
        if (m_cancel && m_cancel->isSet()) return std::nullopt;
    }
}

std::optional<int64_t> CHTTPClient::readRaw(char* buffer, size_t size, const SNetWait& wait) {
    if (m_inputStart == m_inputEnd) return receive(buffer, size, wait);
    const size_t count = std::min(size, m_inputEnd - m_inputStart);
    std::copy_n(m_input.data() + m_inputStart, count, buffer);
    m_inputStart += count;
    return static_cast<int64_t>(count);
}

// Waits only after an unsuccessful attempt, when the limit of silence is known.
std::optional<int64_t> CHTTPClient::receive(char* buffer, size_t size, const SNetWait& wait) {
    std::optional<int64_t> count = m_in->tryRead(buffer, static_cast<int64_t>(size));
    if (count) return count;
    if (!m_silenceEnd) {
        m_silenceEnd = endAfter(m_settings.silenceTimeout);
        return std::nullopt;
    }
    if (m_in->isReadable(wait)) count = m_in->tryRead(buffer, static_cast<int64_t>(size));
    return count;
}

void CHTTPClient::finishBody() {
    disconnect();
    enter(EHTTPStep::done);
}

void CHTTPClient::close() {
    disconnect();
    m_step = EHTTPStep::closed;
}

void CHTTPClient::disconnect() {
    if (m_connection) m_connection->close();
    m_connection.reset();
    m_in.reset();
    m_out.reset();
    m_resolution.reset();
    m_proxyLookUp.reset();
    m_decoder.reset();
    m_output = std::string();
    m_input = std::string();
    m_inputStart = m_inputEnd = 0;
}

void CHTTPClient::enter(EHTTPStep step) {
    m_step = step;
    notify();
}

void CHTTPClient::notify() const {
    if (!m_listeners) return;
    const SHTTPProgress progress{m_step, getURI(), m_received, m_bodySize};
    // From the end, so that a listener may remove itself.
    for (size_t i = m_listeners->getCount(); i-- > 0;)
        if (IHTTPListener* listener = m_listeners->at(i)) listener->progressed(progress);
}

void CHTTPClient::checkUsable() const {
    if (m_step == EHTTPStep::closed) throw CStreamClosedError(getURI());
    if (m_step != EHTTPStep::done && m_cancel && m_cancel->isSet()) throw CAbortedError();
}

void CHTTPClient::checkTimes() {
    const Clock::time_point now = Clock::now();
    for (const auto& end : {m_totalEnd, m_stepEnd, m_silenceEnd})
        if (end && now >= *end) throw CSocketError(ETIMEDOUT);
}

SNetWait CHTTPClient::getWait(bool wait) const {
    if (!wait) return {0, m_cancel};
    std::optional<Clock::time_point> first;
    for (const auto& end : {m_totalEnd, m_stepEnd, m_silenceEnd})
        if (end && (!first || *end < *first)) first = end;
    if (!first) return {SNetWait::kForever, m_cancel};
    const auto rest = std::chrono::ceil<std::chrono::milliseconds>(*first - Clock::now()).count();
    return {std::max<int64_t>(rest, 0), m_cancel};
}

} // namespace peru::net
