// The designs of a project.
#pragma once

#include "ced/Project.h"

#include <string>

namespace host::covers {

using peru::P;

struct SDesign {
    std::string target; // such as "disc"
    int item = 0;       // counts from 1
    P<graphics::CGraphicDocument> document;
};

// `target` is a name, a number from 1 to 6 in the order of ced::TargetType, or empty for the first target
// that has a design of this number. Throws std::runtime_error, which lists the designs, if there is none.
SDesign findDesign(const ced::CProject& project, const std::string& target, int item);

// The content box or the bounding box, in millimetres.
std::string formatBox(const graphics::SRect& box);

} // namespace host::covers
