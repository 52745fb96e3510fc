#include "graphics/Elements.h"
#include "graphics/documents/GraphicDocument.h"
#include "graphics/elements/GraphicLines.h"
#include "graphics/elements/GraphicShape.h"
#include "graphics/elements/GraphicText.h"
#include "graphics/geometry/Units.h"
#include "peru/strings/String.h"

#include <gtest/gtest.h>

#include <cmath>
#include <numbers>

using namespace graphics;

namespace {

// The model under test, computed from the definitions: a corner is rotated around the center.
struct SPlain {
    double x, y, width, height, degrees;

    SPoint corner(double alongX, double alongY) const {
        const double angle = degrees * std::numbers::pi / 180;
        const double dx = alongX * width / 2, dy = alongY * height / 2;
        return {x + dx * std::cos(angle) - dy * std::sin(angle),
                y + dx * std::sin(angle) + dy * std::cos(angle)};
    }
    // How far a point lies beyond the sides on each axis; negative inside.
    SPoint beyond(SPoint point) const {
        const double angle = -degrees * std::numbers::pi / 180;
        const double dx = point.x - x, dy = point.y - y;
        return {std::abs(dx * std::cos(angle) - dy * std::sin(angle)) - width / 2,
                std::abs(dx * std::sin(angle) + dy * std::cos(angle)) - height / 2};
    }
    // Positive inside, in millimetres from the nearest edge.
    double depth(SPoint point) const { return -std::max(beyond(point).x, beyond(point).y); }
    double radius() const { return std::min(width, height) / 2; }
    // From a point to the rectangle; 0 inside.
    double distance(SPoint point) const {
        return std::hypot(std::max(0.0, beyond(point).x), std::max(0.0, beyond(point).y));
    }
    // The widest gap between the projections of two rectangles on this one's axes.
    double gap(const SPlain& other) const {
        double gap = -1e9;
        for (const double turn : {0.0, 90.0}) {
            const double angle = (degrees + turn) * std::numbers::pi / 180;
            const auto project = [&](const SPlain& plain) {
                double low = 1e9, high = -1e9;
                for (const auto& [cx, cy] : {std::pair(-1, -1), {1, -1}, {1, 1}, {-1, 1}}) {
                    const SPoint corner = plain.corner(cx, cy);
                    const double value = corner.x * std::cos(angle) + corner.y * std::sin(angle);
                    low = std::min(low, value), high = std::max(high, value);
                }
                return std::pair(low, high);
            };
            const auto [low, high] = project(*this);
            const auto [otherLow, otherHigh] = project(other);
            gap = std::max({gap, otherLow - high, low - otherHigh});
        }
        return gap;
    }
};

SPlain toPlain(const CGraphicElement& element) {
    return {element.GetCenter().x, element.GetCenter().y, element.GetSize().width, element.GetSize().height,
            element.GetRotation()};
}

} // namespace

TEST(GraphicElement, AgreesWithAPlainModel) {
    std::mt19937 random(1);
    auto document = peru::make<CGraphicDocument>();
    double left = 1e9, top = 1e9, right = -1e9, bottom = -1e9;
    for (int i = 0; i < 100000; ++i) {
        const auto element = peru::make<CGraphicRectangle>();
        tests::place(*element, random);
        document->Add(element);
        const SPlain plain = toPlain(*element);
        double minX = 1e9, minY = 1e9, maxX = -1e9, maxY = -1e9;
        for (const auto& [x, y] : {std::pair(-1, -1), {1, -1}, {1, 1}, {-1, 1}}) {
            const SPoint corner = plain.corner(x, y);
            const SPoint mapped = element->GetBoxMatrix().apply({x * 0.5 + 0.5, y * 0.5 + 0.5});
            ASSERT_LT(std::hypot(corner.x - mapped.x, corner.y - mapped.y), 1e-9);
            minX = std::min(minX, corner.x), maxX = std::max(maxX, corner.x);
            minY = std::min(minY, corner.y), maxY = std::max(maxY, corner.y);
        }
        ASSERT_NEAR(element->GetBoundingSize().width, maxX - minX, 1e-9);
        ASSERT_NEAR(element->GetBoundingSize().height, maxY - minY, 1e-9);
        const SPoint point{tests::between(random, minX, maxX), tests::between(random, minY, maxY)};
        if (const double depth = plain.depth(point); std::abs(depth) > 1e-9) {
            ASSERT_EQ(element->ContainsPoint(point.x, point.y), depth > 0);
        }
        left = std::min(left, minX), right = std::max(right, maxX);
        top = std::min(top, minY), bottom = std::max(bottom, maxY);
    }
    const SRect box = document->GetBoundingBox();
    EXPECT_NEAR(box.left, left, 1e-9);
    EXPECT_NEAR(box.getRight(), right, 1e-9);
    EXPECT_NEAR(box.top, top, 1e-9);
    EXPECT_NEAR(box.getBottom(), bottom, 1e-9);
}

TEST(GraphicElement, RotatesByWholeDegrees) {
    const auto element = peru::make<CGraphicRectangle>();
    for (const auto& [set, stored] : {std::pair(359.9, 359.0),
                                      {-0.5, 0.0},
                                      {-1.0, 359.0},
                                      {720.0, 0.0},
                                      {360.0, 0.0},
                                      {-360.0, 0.0},
                                      {1e300, std::fmod(1e300, 360)},
                                      {std::nan(""), 0.0}}) {
        element->SetRotation(set);
        EXPECT_EQ(element->GetRotation(), stored) << set;
        EXPECT_FALSE(std::signbit(element->GetRotation())) << set;
    }
}

TEST(GraphicElement, ResizesByItsBoundingBox) {
    const auto element = peru::make<CGraphicRectangle>();
    for (const double degrees : {0.0, 90.0, 180.0, 270.0}) {
        element->SetRotation(degrees);
        element->SetBoundingSize(30, 20);
        EXPECT_EQ(element->GetBoundingSize(), (SSize{30, 20})) << degrees;
    }
    element->SetSize(40, 10);
    element->SetRotation(30);
    const SSize bounds = element->GetBoundingSize();
    element->SetBoundingSize(bounds.width * 2, bounds.height * 2);
    EXPECT_NEAR(element->GetSize().width, 80, 1e-9);
    EXPECT_NEAR(element->GetSize().height, 20, 1e-9);
    element->SetBoundingSize(0, 0);
    EXPECT_EQ(element->GetSize(), (SSize{1, 1}));
    const auto circle = peru::make<CGraphicTextCircle>();
    circle->SetRotation(45);
    circle->SetBoundingSize(50, 30);
    EXPECT_EQ(circle->GetSize(), (SSize{30, 30}));
    EXPECT_EQ(circle->GetBoundingSize(), (SSize{30, 30}));
}

TEST(GraphicLine, FollowsItsBox) {
    const auto line = peru::make<CGraphicLine>();
    line->SetLine({10, 40}, {30, 20});
    EXPECT_EQ(line->GetRect(), (SRect{10, 20, 20, 20}));
    line->SetCenter(120, 130);
    EXPECT_EQ(line->GetStart(), (SPoint{110, 140}));
    line->SetSize(40, 10);
    EXPECT_EQ(line->GetStart(), (SPoint{100, 135}));
    EXPECT_EQ(line->GetEnd(), (SPoint{140, 125}));
}

// The shapes on both sides of a touch.
TEST(GraphicElement, IntersectsByOutline) {
    const auto makeAt = [](GraphicElementType type, double x, double degrees,
                           EShapeType kind = EShapeType::rectangle) {
        auto element = CreateElement(type);
        element->SetSize(20, 20);
        element->SetCenter(x, 0);
        element->SetRotation(degrees);
        if (const auto shape = peru::tryCast<CGraphicShape>(element)) {
            shape->SetShapeType(kind);
            shape->SetCornerRadius(10);
        }
        return element;
    };
    using enum GraphicElementType;
    struct SCase {
        GraphicElementType first, second;
        double reach; // the distance of the centers at which they touch; 0 if the pair never intersects
        EShapeType kind = EShapeType::rectangle;
    };
    for (const SCase& c : {SCase{circle, shape, 10 + 10 * std::numbers::sqrt2},
                           {circle, shape, 20, EShapeType::ellipse},
                           {circle, shape, 20, EShapeType::roundedRectangle},
                           {rectangle, shape, 0},
                           {text, text, 0},
                           {circle, image, 0}}) {
        const auto first = makeAt(c.first, 0, 0);
        const auto near = makeAt(c.second, c.reach - 0.01, 45, c.kind);
        EXPECT_EQ(first->Intersects(*near), c.reach > 0) << GraphicTypeToXml(c.second);
        EXPECT_EQ(near->Intersects(*first), c.reach > 0) << GraphicTypeToXml(c.second);
        EXPECT_FALSE(makeAt(c.second, c.reach + 0.01, 45, c.kind)->Intersects(*first));
    }
    const auto inner = makeAt(rectangle, 0, 10);
    inner->SetSize(2, 2);
    EXPECT_TRUE(inner->Intersects(*makeAt(rectangle, 0, 0)));
}

TEST(GraphicElement, IntersectsLikeAPlainModel) {
    std::mt19937 random(4);
    using enum GraphicElementType;
    const std::pair<GraphicElementType, GraphicElementType> kPairs[] = {
        {circle, circle}, {circle, rectangle}, {circle, shape}, {rectangle, rectangle}, {shape, shape}};
    int found = 0;
    for (int i = 0; i < 100000; ++i) {
        const auto& [firstType, secondType] = kPairs[i % 5];
        const auto first = CreateElement(firstType), second = CreateElement(secondType);
        tests::place(*first, random);
        tests::place(*second, random);
        const SPlain a = toPlain(*first), b = toPlain(*second);
        const double gap = secondType == circle  ? std::hypot(a.x - b.x, a.y - b.y) - a.radius() - b.radius()
                           : firstType == circle ? b.distance({a.x, a.y}) - a.radius()
                                                 : std::max(a.gap(b), b.gap(a));
        if (std::abs(gap) < 1e-6) continue;
        ASSERT_EQ(first->Intersects(*second), gap < 0) << i;
        ASSERT_EQ(second->Intersects(*first), gap < 0) << i;
        found += gap < 0;
    }
    EXPECT_GT(found, 5000);
    EXPECT_LT(found, 50000);
}

TEST(Units, FormatLengths) {
    const auto text = [](double value, EUnit unit) {
        return peru::CString::toStdString(formatLength(value, unit)) + " " +
               peru::CString::toStdString(getUnitLabel(unit));
    };
    EXPECT_EQ(text(25.4, EUnit::millimetre), "25.40 mm");
    EXPECT_EQ(text(25.4, EUnit::centimetre), "2.5 cm");
    EXPECT_EQ(text(25.4, EUnit::inch), "1.000 inches");
    EXPECT_DOUBLE_EQ(fromUnit(toUnit(17, EUnit::inch), EUnit::inch), 17);
}
