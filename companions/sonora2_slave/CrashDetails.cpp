#include "sonora2_slave/CrashDetails.h"

#include <cstdio>

namespace slave {

namespace {

char g_text[2048];
std::string g_plugin;
std::string g_file;
size_t g_callStart = 0; // where the line of the call begins

} // namespace

const char* CCrashDetails::getText() {
    return g_text;
}

void CCrashDetails::setPlugin(const std::string& name) {
    g_plugin = name;
    write(nullptr);
}

void CCrashDetails::setFile(const std::string& name) {
    g_file = name;
    write(nullptr);
}

void CCrashDetails::write(const char* operation) {
    int length = std::snprintf(g_text, sizeof g_text - 128, "Plug-in: %s\n", g_plugin.c_str());
    if (!g_file.empty() && length > 0 && static_cast<size_t>(length) < sizeof g_text - 128)
        length += std::snprintf(g_text + length, sizeof g_text - 128 - static_cast<size_t>(length),
                                "File: %s\n", g_file.c_str());
    g_text[sizeof g_text - 128] = '\0';
    g_callStart = std::char_traits<char>::length(g_text);
    if (operation) std::snprintf(g_text + g_callStart, sizeof g_text - g_callStart, "Call: %s\n", operation);
}

CCrashDetails::CCall::CCall(const char* operation) {
    std::snprintf(g_text + g_callStart, sizeof g_text - g_callStart, "Call: %s\n", operation);
}

CCrashDetails::CCall::~CCall() {
    g_text[g_callStart] = '\0';
}

} // namespace slave
