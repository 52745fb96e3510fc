#include "peru/IInterfaceQuery.h"

#include <algorithm>

namespace peru::detail {

namespace {

// Visited objects are held until the search ends, so that no new object can reuse their addresses. The graphs
// are small: a stream and the streams below it.
P<IBase> find(const P<IBase>& object, const std::type_info& wanted, InterfaceProbe probe,
              std::vector<P<IBase>>& visited) {
    if (!object || std::find(visited.begin(), visited.end(), object) != visited.end()) return nullptr;
    visited.push_back(object);
    SInterfaceQueryResult answer;
    if (auto query = tryCast<IInterfaceQuery>(object)) answer = query->queryInterface(wanted);
    if (P<IBase> found = find(answer.delegate, wanted, probe, visited)) return found;
    if (probe(object.get())) return object;
    for (const P<IBase>& part : answer.aggregated)
        if (P<IBase> found = find(part, wanted, probe, visited)) return found;
    return nullptr;
}

} // namespace

P<IBase> findInterface(IBase* object, const std::type_info& wanted, InterfaceProbe probe) {
    P<IBase> start = P<IBase>::share(object);
    // Most objects do not represent others.
    if (!tryCast<IInterfaceQuery>(start)) return start && probe(object) ? start : nullptr;
    std::vector<P<IBase>> visited;
    return find(start, wanted, probe, visited);
}

} // namespace peru::detail
