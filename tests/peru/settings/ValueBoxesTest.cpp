#include "peru/settings/ValueBoxes.h"

#include "peru/Errors.h"
#include "support/Files.h"

#include <bit>
#include <cmath>
#include <limits>
#include <random>

using namespace peru;
using tests::errorOf;
using tests::text;

namespace {

// The text parsed by a box and formatted again, or the error.
template <class Box> std::string pass(const char* value) {
    try {
        return text(Box::parse(value)->toString());
    } catch (const CParseError& error) {
        return text(error.getDescription());
    }
}

constexpr const char* kBadInteger = "Error parsing integer.";
constexpr const char* kBadFloat = "Error parsing floating point value.";

} // namespace

TEST(ValueBoxes, parse_TakesTheWholeTextOrNothing) {
    const struct {
        std::string (*pass)(const char*);
        const char* text;
        const char* result;
    } cases[] = {
        {pass<CBool>, "true", "true"},
        {pass<CBool>, "false", "false"},
        {pass<CInt>, "-0", "0"},
        {pass<CInt>, "+7", "7"},
        {pass<CInt>, "-2147483648", "-2147483648"},
        {pass<CInt>, "2147483647", "2147483647"},
        {pass<CInt64>, "9223372036854775807", "9223372036854775807"},
        {pass<CDouble>, "-0", "-0"},
        {pass<CDouble>, "1.50", "1.5"},
        {pass<CDouble>, "-2e3", "-2000"},
        {pass<CDouble>, "nan", "nan"},
        {pass<CDouble>, "-inf", "-inf"},
        {pass<CFloat>, "+0.1", "0.1"},
        // Half way between two floats but for its last digit: rounding to a double first goes the wrong way.
        {pass<CFloat>, "1.00000017881393432617187499", "1.0000001"},
    };
    for (const auto& c : cases) EXPECT_EQ(c.pass(c.text), c.result) << c.text;
    for (const char* bad : {"True", ""}) EXPECT_EQ(pass<CBool>(bad), kBadInteger) << bad;
    for (const char* bad : {"2147483648", "-2147483649", "0x10", " 1", "1 ", "+-1", "1.5", ""})
        EXPECT_EQ(pass<CInt>(bad), kBadInteger) << bad;
    EXPECT_EQ(pass<CInt64>("9223372036854775808"), kBadInteger);
    for (const char* bad : {"++1", "1,5", "1e400", "1.5 ", ""})
        EXPECT_EQ(pass<CDouble>(bad), kBadFloat) << bad;
    for (const char* bad : {"1e39", "--1"}) EXPECT_EQ(pass<CFloat>(bad), kBadFloat) << bad;
}

TEST(ValueBoxes, toString_NumbersComeBackBitForBit) {
    std::mt19937_64 random(1);
    for (int i = 0; i < 20000; ++i) {
        const uint64_t bits = random();
        const auto wide = std::bit_cast<double>(bits);
        const auto narrow = std::bit_cast<float>(static_cast<uint32_t>(bits));
        if (!std::isfinite(wide) || !std::isfinite(narrow)) continue;
        EXPECT_EQ(std::bit_cast<uint64_t>(CDouble::parseValue(CDouble::formatValue(wide))), bits);
        EXPECT_EQ(std::bit_cast<uint32_t>(CFloat::parseValue(CFloat::formatValue(narrow))), uint32_t(bits));
    }
}
