#include "sonora2_slave/CrashDetails.h"

#include <cstdio>

namespace slave {

namespace {

constexpr size_t kSize = 2048;
constexpr size_t kCallRoom = 128; // for the line of the call

char g_text[kSize];
std::string g_plugin;
std::string g_file;
const char* g_operation = nullptr;
size_t g_callStart = 0; // where the line of the call begins

void writeCall() {
    if (g_operation)
        std::snprintf(g_text + g_callStart, kCallRoom, "Call: %s\n", g_operation);
    else
        g_text[g_callStart] = '\0';
}

} // namespace

const char* CCrashDetails::getText() {
    return g_text;
}

void CCrashDetails::setPlugin(const std::string& name) {
    g_plugin = name;
    write();
}

void CCrashDetails::setFile(const std::string& name) {
    g_file = name;
    write();
}

void CCrashDetails::write() {
    std::string text = "Plug-in: " + g_plugin + "\n";
    if (!g_file.empty()) text += "File: " + g_file + "\n";
    g_callStart = text.copy(g_text, kSize - kCallRoom);
    writeCall();
}

CCrashDetails::CCall::CCall(const char* operation) {
    g_operation = operation;
    writeCall();
}

CCrashDetails::CCall::~CCall() {
    g_operation = nullptr;
    writeCall();
}

} // namespace slave
