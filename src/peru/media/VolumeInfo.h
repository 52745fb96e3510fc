// A level measurement.
#pragma once

#include "peru/Object.h"
#include "peru/media/Api.h"

namespace peru::media {

// The levels of the left and right channel, from 0.0 to 1.0; equal for mono.
class PERU_MEDIA_API CVolumeInfo : public CObject {
public:
    CVolumeInfo(double left, double right) : m_left(left), m_right(right) {}
    ~CVolumeInfo() override;

    double getLeft() const { return m_left; }
    double getRight() const { return m_right; }

private:
    const double m_left;
    const double m_right;
};

} // namespace peru::media
