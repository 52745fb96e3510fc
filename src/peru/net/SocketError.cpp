#include "peru/net/SocketError.h"

#include "peru/strings/IStringLocalizer.h"

#include <cerrno>
#include <string>

namespace peru::net {

namespace {

P<IString> getText(int code) {
    const std::string number = std::to_string(code);
    const auto text = [&](const char* key, const char* words) {
        return localize(key, words, {{"%CODE%", number.c_str()}});
    };
    switch (code) {
    case EHOSTUNREACH:
    case ENETUNREACH:
        return text("peru.net.win32.CSocketError.NoRouteToHost", "No route to remote host (code=%CODE%).");
#ifdef EHOSTDOWN
    case EHOSTDOWN:
        return text("peru.net.win32.CSocketError.RemoteHostDown",
                    "The remote host is not available (code=%CODE%).");
#endif
    case ECONNRESET:
    case EPIPE:
        return text("peru.net.win32.CSocketError.RemoteConnectionClose",
                    "The connection was closed by the remote host (code=%CODE%).");
    case ECONNABORTED:
        return text("peru.net.win32.CSocketError.ConnectionAborted",
                    "The connection was closed due to a timeout or protocol failure (code=%CODE%).");
    case ENETDOWN:
    case ENETRESET:
        return text("peru.net.win32.CSocketError.ConnectionFailure",
                    "The connection was closed due to a network failure (code=%CODE%).");
    case ETIMEDOUT:
        return text("peru.net.win32.CSocketError.ConnectionTimeOut",
                    "The connection timed out (code=%CODE%).");
    case ECONNREFUSED:
        return text("peru.net.win32.CSocketError.ConnectionRefused",
                    "Connection refused by the remote side (code=%CODE%).");
    }
    return text("peru.net.win32.CSocketError.General", "Network socket error (code=%CODE%).");
}

} // namespace

PERU_EXCEPTION_IMPL(CSocketError)
CSocketError::CSocketError(int code) : CError(getText(code)), m_code(code) {}

} // namespace peru::net
