// The arrays of objects and their enumerators.
#pragma once

#include "peru/collections/IArray.h"

#include <vector>

namespace peru {

// Filled on construction, constant afterwards.
class PERU_API CConstArray : public CObject, public IConstArray {
public:
    explicit CConstArray(std::vector<PC<IBase>> elements);
    ~CConstArray() override;

    int32_t getCount() const override;
    PC<IBase> getConstAt(int32_t index) const override;
    P<IConstEnum> createConstEnum(bool backwards = false) const override;

private:
    std::vector<PC<IBase>> m_elements;
};

class PERU_API CArray : public CObject, public IArray {
public:
    class CEnum;
    class CConstEnum;

    CArray();
    ~CArray() override;

    int32_t getCount() const override;
    PC<IBase> getConstAt(int32_t index) const override;
    P<IConstEnum> createConstEnum(bool backwards = false) const override;
    P<IBase> getAt(int32_t index) const override;
    P<IEnum> createEnum(bool backwards = false) override;
    void add(const P<IBase>& element) override;
    void insertAt(int32_t index, const P<IBase>& element) override;
    void setAt(int32_t index, const P<IBase>& element) override;
    void removeAt(int32_t index) override;
    bool remove(const P<IBase>& element) override;
    void clear() override;

private:
    std::vector<P<IBase>> m_elements;
};

// Enumerates any array of constant elements, forwards or backwards.
class PERU_API CArray::CConstEnum : public CObject, public IConstEnum {
public:
    CConstEnum(const PC<IConstArray>& array, bool backwards);
    ~CConstEnum() override;

    bool hasMore() const override;
    int32_t getCount() const override;
    PC<IBase> getNextConst() override;
    void reset() override;

private:
    PC<IConstArray> m_array;
    int32_t m_index = 0;
    bool m_backwards;
};

class PERU_API CArray::CEnum : public CObject, public IEnum {
public:
    CEnum(const P<IArray>& array, bool backwards);
    ~CEnum() override;

    bool hasMore() const override;
    int32_t getCount() const override;
    PC<IBase> getNextConst() override;
    P<IBase> getNext() override;
    void reset() override;

private:
    P<IArray> m_array;
    int32_t m_index = 0;
    bool m_backwards;
};

} // namespace peru
