// How an image is divided when it is painted at another size than its own.
#pragma once

namespace graphics {

struct SScaleMargins {
    double left = 0;
    double top = 0;
    double right = 0;
    double bottom = 0;
    double leftFactor = 1;
    double topFactor = 1;
    double rightFactor = 1;
    double bottomFactor = 1;

    bool operator==(const SScaleMargins&) const = default;
};

} // namespace graphics
