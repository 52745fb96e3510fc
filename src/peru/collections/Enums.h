// Enumerators without a collection of their own.
#pragma once

#include "peru/collections/IEnum.h"

#include <vector>

namespace peru {

class PERU_API CEmptyEnum : public CObject, public IEnum {
public:
    CEmptyEnum();
    ~CEmptyEnum() override;

    bool hasMore() const override;
    int32_t getCount() const override;
    PC<IBase> getNextConst() override; // always throws CEndOfEnumError
    P<IBase> getNext() override;       // likewise
    void reset() override;
};

// Chains enumerators. The chain takes them over: reset() resets all of them.
class PERU_API CMultiEnum : public CObject, public IEnum {
public:
    explicit CMultiEnum(std::vector<P<IEnum>> enums = {});
    ~CMultiEnum() override;

    void addEnum(const P<IEnum>& elements);

    bool hasMore() const override;
    int32_t getCount() const override; // the sum
    PC<IBase> getNextConst() override;
    P<IBase> getNext() override;
    void reset() override;

private:
    std::vector<P<IEnum>> m_enums;
};

// The same for enumerators that only return constant objects.
class PERU_API CConstMultiEnum : public CObject, public IConstEnum {
public:
    explicit CConstMultiEnum(std::vector<P<IConstEnum>> enums = {});
    ~CConstMultiEnum() override;

    void addEnum(const P<IConstEnum>& elements);

    bool hasMore() const override;
    int32_t getCount() const override;
    PC<IBase> getNextConst() override;
    void reset() override;

private:
    std::vector<P<IConstEnum>> m_enums;
};

} // namespace peru
