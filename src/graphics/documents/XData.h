// Typed values attached to a document.
#pragma once

#include "graphics/Api.h"
#include "graphics/geometry/Geometry.h"
#include "peru/Object.h"

#include <cstdint>
#include <map>
#include <string>

namespace graphics {

using peru::P;

class GRAPHICS_API CXData : public peru::CObject {
protected:
    CXData() = default;
    ~CXData() override = default;

public:
    // The value as the text of the attribute "value", and back. Throws CParseError.
    virtual std::string Save() const = 0;
    virtual void Load(const std::string& text) = 0;
    virtual std::string GetTypeName() const = 0;
    virtual P<CXData> Clone() const = 0;
    virtual bool HasValue() const = 0;
};

class GRAPHICS_API CStringXData : public CXData {
public:
    explicit CStringXData(std::string value = {}) : value(std::move(value)) {}
    ~CStringXData() override = default;
    std::string Save() const override { return value; }
    void Load(const std::string& text) override { value = text; }
    std::string GetTypeName() const override { return "string"; }
    P<CXData> Clone() const override { return peru::make<CStringXData>(value); }
    bool HasValue() const override { return !value.empty(); }

    std::string value;
};

class GRAPHICS_API CRectXData : public CXData {
public:
    explicit CRectXData(const SRect& value = {}) : value(value) {}
    ~CRectXData() override = default;
    // "left,top,width,height"
    std::string Save() const override;
    void Load(const std::string& text) override;
    std::string GetTypeName() const override { return "rect"; }
    P<CXData> Clone() const override { return peru::make<CRectXData>(value); }
    bool HasValue() const override { return value != SRect(); }

    SRect value;
};

class GRAPHICS_API CIntXData : public CXData {
public:
    explicit CIntXData(int32_t value = 0) : value(value) {}
    ~CIntXData() override = default;
    std::string Save() const override { return std::to_string(value); }
    void Load(const std::string& text) override;
    std::string GetTypeName() const override { return "int"; }
    P<CXData> Clone() const override { return peru::make<CIntXData>(value); }
    bool HasValue() const override { return true; }

    int32_t value;
};

// By name. Names become element names in files.
class GRAPHICS_API CXDatas : public peru::CObject {
public:
    CXDatas() = default;
    ~CXDatas() override = default;

    // An object of the class with the type name; empty if there is none.
    static P<CXData> Create(const std::string& typeName);

    bool IsEmpty() const { return m_datas.empty(); }
    const std::map<std::string, P<CXData>>& GetAll() const { return m_datas; }
    // Empty if there is none.
    P<CXData> Get(const std::string& name) const;
    // An empty handle removes the entry.
    void Set(const std::string& name, const P<CXData>& data);
    P<CXDatas> Clone() const;

private:
    std::map<std::string, P<CXData>> m_datas;
};

} // namespace graphics
