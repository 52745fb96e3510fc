// Values of documents as XML attributes and children.
#pragma once

#include "graphics/elements/Appearance.h"
#include "graphics/elements/ScaleMargins.h"
#include "graphics/geometry/Geometry.h"
#include "peru/collections/IEnum.h"
#include "peru/xml/IXmlNode.h"

#include <optional>
#include <string>

namespace graphics {

using peru::P;
using Node = P<peru::IXmlNode>;

// The text without the control characters and malformed bytes that XML cannot hold. A text that was pasted
// with one would otherwise make its document impossible to save.
std::string removeInvalid(std::string_view text);

// An empty value writes nothing. Values pass through removeInvalid().
void writeAttribute(const Node& node, const char* name, const std::string& value);
void writeNumber(const Node& node, const char* name, double value);
void writeInteger(const Node& node, const char* name, int64_t value);
void writeBool(const Node& node, const char* name, bool value);

// They leave the value unchanged and return false if the attribute is missing, and throw CParseError, which
// names the attribute, if it cannot be read.
bool readAttribute(const Node& node, const char* name, std::string& value);
bool readNumber(const Node& node, const char* name, double& value);
bool readInteger(const Node& node, const char* name, int64_t& value);
bool readInteger(const Node& node, const char* name, int32_t& value);
bool readBool(const Node& node, const char* name, bool& value);

[[noreturn]] void throwInvalid(const Node& node, const char* attribute, const std::string& value);

// Children. The reading functions do nothing and return false if the child is missing.
Node addChild(const Node& node, const char* name);
std::string getName(const Node& node);
void write(const Node& node, const char* key, const SColour& colour);
bool read(const Node& node, const char* key, SColour& colour);
void write(const Node& node, const char* key, const SBrush& brush);
bool read(const Node& node, const char* key, SBrush& brush);
void write(const Node& node, const char* key, const SPen& pen);
bool read(const Node& node, const char* key, SPen& pen);
void write(const Node& node, const char* key, const SGradient& gradient);
bool read(const Node& node, const char* key, SGradient& gradient);
void write(const Node& node, const char* key, const SFont& font);
bool read(const Node& node, const char* key, SFont& font);
void write(const Node& node, const char* key, const SPoint& point);
bool read(const Node& node, const char* key, SPoint& point);
void write(const Node& node, const char* key, const SSize& size);
bool read(const Node& node, const char* key, SSize& size);
void write(const Node& node, const char* key, const SRect& rect);
bool read(const Node& node, const char* key, SRect& rect);
void write(const Node& node, const char* key, const SScaleMargins& margins);
bool read(const Node& node, const char* key, SScaleMargins& margins);

} // namespace graphics
