#include "peru/pipes/posix/PipeManager.h"

#include "peru/Errors.h"
#include "peru/GlobalObjFactory.h"
#include "peru/pipes/PipeName.h"
#include "peru/pipes/posix/PipeClient.h"
#include "peru/pipes/posix/PipeServer.h"
#include "peru/strings/StringFormat.h"

namespace peru::posix {

namespace {

void checkName(const P<IString>& name, const char* method, CPipeManager* manager) {
    if (!isPipeName(name))
        throw CInvalidArgError(format("the pipe name '%s'", name), method, P<IBase>::share(manager));
}

} // namespace

P<IPipeServer> CPipeManager::createServer(const P<IString>& name) {
    checkName(name, "createServer", this);
    return make<CPipeServer>(name);
}

P<IPipeClient> CPipeManager::createClient(const P<IString>& name) {
    checkName(name, "createClient", this);
    return make<CPipeClient>(name);
}

} // namespace peru::posix

namespace peru {

P<IPipeManager> getPipeManager() {
    static const CGlobalObjFactory::SKey key;
    return CGlobalObjFactory::get<IPipeManager>(key,
                                                [] { return P<IPipeManager>(make<posix::CPipeManager>()); });
}

} // namespace peru
