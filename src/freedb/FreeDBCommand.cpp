#include "freedb/FreeDBCommand.h"

#include "peru/Errors.h"
#include "peru/log/LogArea.h"
#include "peru/net/HTTPError.h"
#include "peru/net/ProxyRules.h"
#include "peru/net/SocketError.h"
#include "peru/streams/MemoryIOStream.h"
#include "peru/strings/IStringLocalizer.h"
#include "peru/system/IPathes.h"
#include "peru/uri/URI.h"

#include <algorithm>
#include <array>
#include <optional>

namespace freedb {

using peru::CError;
using peru::CString;
using peru::localize;
using namespace peru::net;

namespace {

constexpr int32_t kProxyPort = 80;
constexpr size_t kLoggedBytes = 200;

// A proxy that the application has chosen.
class CChosenProxy : public peru::CObject, public IProxyManager {
public:
    CChosenProxy(const P<peru::IURI>& proxy, std::string exceptions)
        : m_proxy(proxy), m_exceptions(std::move(exceptions)) {}
    ~CChosenProxy() override = default;

    P<IProxyLookUp> startLookUp(const P<peru::IURI>& target) override {
        return peru::make<CResult>(getProxy(target));
    }
    P<peru::IURI> getProxy(const P<peru::IURI>& target) override {
        return m_proxy && !isBypassed(m_exceptions, target) ? m_proxy : nullptr;
    }

private:
    class CResult : public peru::CObject, public IProxyLookUp {
    public:
        explicit CResult(const P<peru::IURI>& proxy) : m_proxy(proxy) {}
        ~CResult() override = default;
        bool isDone(const SNetWait&) override { return true; }
        P<peru::IURI> getProxy() const override { return m_proxy; }

    private:
        P<peru::IURI> m_proxy;
    };

    P<peru::IURI> m_proxy; // empty: direct
    std::string m_exceptions;
};

P<IProxyManager> chooseProxies(const SFreeDBSettings& settings) {
    if (!settings.proxy) return createProxyManager(kProxyPort);
    return peru::make<CChosenProxy>(parseProxy(*settings.proxy, kProxyPort), settings.noProxy);
}

std::string toAuthority(const SFreeDBSettings& settings) {
    const bool isBare = settings.host.find(':') != std::string::npos && !settings.host.starts_with('[');
    return (isBare ? "[" + settings.host + "]" : settings.host) + ":" + std::to_string(settings.port);
}

P<peru::IURI> toURI(const SFreeDBSettings& settings) {
    const auto require = [](bool condition, const char* name) {
        if (!condition) throw peru::CInvalidArgError(name, "CFreeDBCommand");
    };
    require(!settings.host.empty() && settings.host.find_first_of("/?#@\r\n\t ") == std::string::npos,
            "host");
    require(settings.port > 0 && settings.port <= 0xFFFF, "port");
    require(!settings.clientName.empty(), "clientName");
    require(!settings.clientVersion.empty(), "clientVersion");
    const bool isAbsolute = settings.path.starts_with('/');
    return peru::make<peru::CURI>(
        CString::fromUTF8("http://" + toAuthority(settings) + (isAbsolute ? "" : "/") + settings.path));
}

P<CFreeDBCache> openCache(const SFreeDBSettings& settings) {
    if (settings.cacheFolder.empty()) return nullptr;
    const bool isFolder = settings.cacheFolder.ends_with('/');
    return peru::make<CFreeDBCache>(
        peru::getPathes()->fromPlatformPath(CString::fromUTF8(settings.cacheFolder + (isFolder ? "" : "/"))));
}

// The charset of a "Content-Type" header; empty if it states none.
std::string findCharset(const CHTTPHeaders& headers) {
    std::string_view rest = headers.find("Content-Type").value_or("");
    while (!rest.empty()) {
        const size_t end = std::min(rest.find(';'), rest.size());
        const std::string_view parameter = trimBlanks(rest.substr(0, end));
        rest.remove_prefix(std::min(end + 1, rest.size()));
        const size_t equals = parameter.find('=');
        if (equals == std::string_view::npos || !equalsIgnoreCase(parameter.substr(0, equals), "charset"))
            continue;
        std::string charset(parameter.substr(equals + 1));
        std::erase(charset, '"');
        return charset;
    }
    return {};
}

} // namespace

// A failed operation no longer knows how far it was.
class CFreeDBCommand::CSteps : public peru::CObject, public IHTTPListener {
public:
    CSteps() = default;
    ~CSteps() override = default;
    void progressed(const SHTTPProgress& progress) override {
        isConnected = progress.step >= EHTTPStep::sendRequest;
    }
    bool isConnected = false;
};

CFreeDBCommand::CFreeDBCommand(const SFreeDBSettings& settings, const std::string& command,
                               const std::string& entry)
    : m_settings(settings), m_command(command), m_entry(entry), m_cache(openCache(settings)),
      m_steps(peru::make<CSteps>()) {
    const P<peru::IURI> uri = toURI(settings);
    m_server = CString::toStdString(uri->getAsString());
    const std::string text = "cmd=" + command + "&hello=" + encode(settings.user) + "+" +
                             encode(settings.userHost) + "+" + encode(settings.clientName) + "+" +
                             encode(settings.clientVersion) + "&proto=6";
    const P<peru::CMemoryIOStream> body = peru::make<peru::CMemoryIOStream>();
    body->write(text.data(), static_cast<int64_t>(text.size()));
    body->seek(0);
    const P<CHTTPRequest> request = peru::make<CHTTPRequest>("POST", uri, body);
    request->getHeaders().add("Host", toAuthority(settings).c_str());
    request->getHeaders().add("Content-Type", "application/x-www-form-urlencoded");
    SHTTPSettings limits;
    limits.connectTimeout = settings.connectTimeout;
    limits.silenceTimeout = settings.silenceTimeout;
    limits.totalTimeout = settings.totalTimeout;
    limits.maxBodySize = settings.maxReplySize;
    limits.proxies = chooseProxies(settings);
    m_operation = peru::make<CHTTPOperation>(request, limits);
    m_operation->addListener(m_steps.get());
}

CFreeDBCommand::~CFreeDBCommand() = default;

// A blank within a field would begin the next one.
std::string CFreeDBCommand::encode(const std::string& text) {
    constexpr char kDigits[] = "0123456789ABCDEF";
    std::string encoded;
    for (const char c : text) {
        const auto byte = static_cast<unsigned char>(c);
        const bool isPlain = (c >= '0' && c <= '9') || (c >= 'A' && c <= 'Z') || (c >= 'a' && c <= 'z') ||
                             c == '-' || c == '_' || c == '.';
        if (isPlain || c == ' ')
            encoded += isPlain ? c : '_';
        else
            encoded.append({'%', kDigits[byte >> 4], kDigits[byte & 0xF]});
    }
    return encoded;
}

void CFreeDBCommand::cancel() {
    m_operation->cancel();
}

bool CFreeDBCommand::isCancelled() const {
    return m_operation->isCancelled();
}

bool CFreeDBCommand::advance(bool wait) {
    if (m_result != EFreeDBResult::pending) return true;
    try {
        if (isCancelled()) throw peru::CAbortedError();
        if (m_cache && !m_settings.refreshCache && !std::exchange(m_triedCache, true)) takeFromCache();
        return m_result != EFreeDBResult::pending || exchange(wait);
    } catch (const peru::CAbortedError&) {
        fail(localize("freedb.CFreeDBCommand.Cancelled", "The operation has been aborted"));
    } catch (const CHTTPError& error) {
        fail(localize("freedb.CFreeDBCommand.HTTPErrorResponse",
                      "The freedb server has answered with an HTTP error response (%MSG%).",
                      {{"%MSG%", error.getDescription()}}));
    } catch (const peru::CException& error) {
        // Failures after that have reasons of their own.
        if (m_steps->isConnected) {
            fail(error.getDescription());
        } else {
            peru::getLogManager()->logException(CString::fromUTF8("freedb"), error);
            fail(localize("freedb.CFreeDBCommand.CannotLocateServer",
                          "The internet music database server could not be located."));
        }
    }
    return true;
}

void CFreeDBCommand::takeFromCache() {
    const std::optional<SCachedReply> cached = m_cache->find(m_entry, m_server, m_command);
    if (!cached) return;
    try {
        finish(*cached);
        m_fromCache = true;
    } catch (const CError&) {
        m_reply.clear(); // the server is asked instead
    }
}

bool CFreeDBCommand::exchange(bool wait) {
    if (!m_operation->advance(wait)) return false;
    const P<CHTTPResponse> response = m_operation->getResponse();
    if (!response->isSuccess())
        throw CHTTPError(response->getStatus(), response->getReason(), m_operation->getURI());
    const P<CHTTPInStream> stream = m_operation->getInStream();
    std::array<char, 16 * 1024> block; // not initialised: this runs with every poll
    for (;;) {
        std::optional<int64_t> count;
        if (wait)
            count = stream->readSome(block.data(), block.size());
        else
            count = stream->tryRead(block.data(), block.size());
        if (!count) return false;
        if (*count == 0) break;
        m_received.append(block.data(), static_cast<size_t>(*count));
    }
    const SCachedReply reply{findCharset(response->getHeaders()), std::move(m_received)};
    try {
        finish(reply);
    } catch (const CError&) {
        const peru::CLogArea area(peru::getLogManager(), CString::fromUTF8("freedb"));
        const std::string start = CTextDecoder({}, {}).decode(reply.text.substr(0, kLoggedBytes));
        peru::getLogManager()->error(
            CString::fromUTF8("freedb"),
            CString::fromUTF8("Received invalid reply from server: ")->concat(CString::fromUTF8(start)));
        throw;
    }
    if (m_cache && m_result != EFreeDBResult::none) m_cache->store(m_entry, m_server, m_command, reply);
    return true;
}

void CFreeDBCommand::finish(const SCachedReply& reply) {
    m_reply = reply.text;
    m_result = evaluate(m_reply, CTextDecoder(m_settings.codePage, reply.charset));
}

void CFreeDBCommand::fail(const P<peru::IString>& message) {
    m_result = EFreeDBResult::failed;
    m_error = message;
    m_operation->close();
}

} // namespace freedb
