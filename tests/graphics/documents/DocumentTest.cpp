#include "graphics/Elements.h"
#include "graphics/documents/FreeForm.h"
#include "graphics/elements/GraphicMirror.h"
#include "graphics/elements/GraphicShape.h"
#include "graphics/elements/GraphicTable.h"
#include "peru/Errors.h"
#include "support/Files.h"

#include <gtest/gtest.h>

using namespace graphics;
using tests::P;

namespace {

P<CGraphicElement> makeRect(double x, double y) {
    auto element = peru::make<CGraphicRectangle>();
    element->SetSize(10, 10);
    element->SetCenter(x, y);
    return element;
}

class CCounter : public IGraphicListener {
public:
    ~CCounter() override = default;
    void OnGraphicChanged(CGraphicBase& element) override {
        ++count;
        if (once) element.RemoveListener(this);
    }
    int count = 0;
    bool once = false;
};

} // namespace

TEST(GraphicDocument, OrdersItsElements) {
    auto document = peru::make<CGraphicDocument>();
    const auto a = makeRect(0, 0), b = makeRect(2, 0), c = makeRect(4, 0);
    document->Add(a);
    document->Add(c);
    document->Insert(1, b);
    EXPECT_EQ(document->GetElements(), (std::vector{a, b, c}));
    EXPECT_EQ(document->FindAt(3, 0), c);
    c->SetVisible(false);
    EXPECT_EQ(document->FindAt(3, 0), b);
    document->MoveToTop(document->GetElement(0));
    EXPECT_EQ(document->GetElements(), (std::vector{b, c, a}));
    document->MoveToBottom(c);
    EXPECT_EQ(document->IndexOf(c), 0);
    EXPECT_TRUE(document->Remove(document->GetElement(1)));
    EXPECT_FALSE(document->Remove(b));
    EXPECT_EQ(document->GetElements(), (std::vector{c, a}));
    EXPECT_THROW(document->Add(a), peru::CInvalidArgError);
    EXPECT_THROW(document->Insert(3, b), peru::CInvalidArgError);
    EXPECT_THROW(document->GetElement(-1), peru::CInvalidArgError);
    EXPECT_THROW(document->Add(nullptr), peru::CInvalidArgError);
}

TEST(GraphicDocument, TracksItsBoundingBox) {
    auto document = peru::make<CGraphicDocument>();
    EXPECT_EQ(document->GetBoundingBox(), SRect());
    const auto element = makeRect(20, 20);
    document->Add(element);
    EXPECT_EQ(document->GetBoundingBox(), (SRect{15, 15, 10, 10}));
    document->BeginUpdate();
    document->BeginUpdate();
    element->SetCenter(30, 20);
    document->EndUpdate();
    EXPECT_EQ(document->GetBoundingBox(), (SRect{15, 15, 10, 10}));
    document->EndUpdate();
    EXPECT_EQ(document->GetBoundingBox(), (SRect{25, 15, 10, 10}));
    document->EndUpdate();
    EXPECT_EQ(document->GetUpdateCount(), 0);
    document->Remove(element);
    EXPECT_EQ(document->GetBoundingBox(), SRect());
    document->Add(element);
    document->SetContentBox(SRect{0, 0, 1, 1});
    document->Clear();
    EXPECT_FALSE(document->GetContentBox());
    document.reset();
    element->SetCenter(0, 0); // nobody listens any more
}

TEST(GraphicBase, NotifiesListeners) {
    const auto element = makeRect(0, 0);
    const auto once = peru::make<CCounter>(), always = peru::make<CCounter>();
    once->once = true;
    element->AddListener(once.get());
    element->AddListener(always.get());
    element->SetCenter(1, 1);
    element->SetSize(2, 2);
    element->SetRotation(90);
    element->SetTopLeft(0, 0);
    EXPECT_EQ(element->GetCenter(), (SPoint{1, 1}));
    EXPECT_EQ(once->count, 1);
    EXPECT_EQ(always->count, 4);
    element->RemoveListener(always.get());
}

TEST(GraphicElementType, HasTagsAndNames) {
    for (int value = 0; value < kGraphicElementTypeCount; ++value) {
        const auto type = static_cast<GraphicElementType>(value);
        EXPECT_EQ(GraphicTypeFromXml(GraphicTypeToXml(type)), type);
        const auto element = CreateElement(type);
        if (!element) continue;
        EXPECT_EQ(element->GetType(), type);
        EXPECT_EQ(element->GetDisplayName(), GetGraphicTypeName(type));
    }
    EXPECT_EQ(CreateElement(GraphicElementType::rectangle)->GetDisplayName(), "Unknown");
    EXPECT_EQ(CreateElement(GraphicElementType::text)->GetDisplayName(), "Text");
    EXPECT_EQ(tests::errorOf<peru::CError>([] { GraphicTypeFromXml("oval"); }),
              "GraphicTypeFromXml. Unknwown type:oval");
    EXPECT_THROW(GraphicTypeToXml(static_cast<GraphicElementType>(19)), peru::CError);
    EXPECT_THROW(ShapeTypeFromXml("oval"), peru::CError);
    EXPECT_EQ(ShapeTypeFromXml("free-form"), EShapeType::freeForm);
}

TEST(GraphicElement, ClonesDeeply) {
    auto document = peru::make<CGraphicDocument>();
    const auto shape = peru::make<CGraphicShape>();
    shape->SetName("star");
    shape->SetShapeType(EShapeType::freeForm);
    shape->SetFreeForm(getFreeFormManager()->Find("freeform.star"));
    shape->AddTag("front");
    shape->AddGroup(3);
    shape->AddGroup(0);
    shape->SetPen({{1, 2, 3, 4}, kStyleDot, 2});
    document->Add(shape);
    // A mirror that shows the shape itself and an element of its own.
    const auto mirror = peru::make<CGraphicMirror>();
    mirror->SetDocument(peru::make<CGraphicDocument>());
    mirror->GetDocument()->Add(shape);
    mirror->GetDocument()->Add(makeRect(1, 2));
    document->Add(mirror);
    document->SetXDatas(peru::make<CXDatas>());
    document->GetXDatas()->Set("count", peru::make<CIntXData>(7));

    const auto copy = document->Clone();
    ASSERT_EQ(copy->GetCount(), 2);
    const auto newShape = P<CGraphicShape>(copy->GetElement(0));
    EXPECT_NE(newShape, shape);
    EXPECT_NE(newShape->GetUnique(), shape->GetUnique());
    EXPECT_EQ(newShape->GetName(), "star");
    EXPECT_EQ(newShape->GetTags(), std::set<std::string>{"front"});
    EXPECT_EQ(newShape->GetGroups(), std::set<int32_t>{3});
    EXPECT_TRUE(newShape->SharesGroupWith(*shape));
    EXPECT_EQ(newShape->GetPen(), shape->GetPen());
    EXPECT_EQ(newShape->GetFreeForm()->GetDisplayName(), "Star");
    const auto inner = P<CGraphicMirror>(copy->GetElement(1))->GetDocument();
    EXPECT_NE(inner, mirror->GetDocument());
    EXPECT_EQ(inner->GetElement(0), copy->GetElement(0));
    EXPECT_NE(inner->GetElement(1), mirror->GetDocument()->GetElement(1));
    P<CIntXData>(copy->GetXDatas()->Get("count"))->value = 8;
    EXPECT_EQ(document->GetXDatas()->Get("count")->Save(), "7");
}

TEST(FreeForm, FillsItsBox) {
    for (const auto& form : getFreeFormManager()->GetForms()) {
        const Polygon polygon = form->GetPolygon({10, 20, 30, 40});
        EXPECT_EQ(getBounds(polygon), (SRect{10, 20, 30, 40})) << form->GetId();
        EXPECT_EQ(polygon.front(), polygon.back()) << form->GetId();
        EXPECT_EQ(form->Clone()->GetDisplayName(), form->GetDisplayName());
    }
    const auto shape = peru::make<CGraphicShape>();
    shape->SetShapeType(EShapeType::freeForm);
    EXPECT_TRUE(shape->GetOutline().empty());
    EXPECT_FALSE(shape->Intersects(*shape));
}

TEST(XData, ReadsWhatItWrites) {
    const auto rect = peru::make<CRectXData>(SRect{0.1, -2, 1e-7, 4});
    const auto copy = CXDatas::Create("rect");
    copy->Load(rect->Save());
    EXPECT_EQ(P<CRectXData>(copy)->value, rect->value);
    for (const char* text : {"", "1,2,3", "1,2,3,4,5", "1,2,3,x", "1,2,3,inf"})
        EXPECT_THROW(copy->Load(text), peru::CParseError) << text;
    for (const char* text : {"", "1.5", "2147483648", "-"})
        EXPECT_THROW(CXDatas::Create("int")->Load(text), peru::CParseError) << text;
    EXPECT_FALSE(CXDatas::Create("colour"));
}

// Random operations on a grid of numbers, which the cells' content ids carry.
TEST(GraphicTable, AgreesWithAPlainGrid) {
    std::mt19937 random(2);
    const auto table = peru::make<CGraphicTable>();
    std::vector<std::vector<std::string>> grid;
    int cols = 0;
    for (int step = 0; step < 2000; ++step) {
        const int rows = static_cast<int>(grid.size());
        const int operation = static_cast<int>(random() % 6), count = 1 + static_cast<int>(random() % 2);
        const int row = static_cast<int>(random() % static_cast<unsigned>(rows + 1));
        const int col = static_cast<int>(random() % static_cast<unsigned>(cols + 1));
        if (operation == 0 && rows < 8) {
            table->InsertRows(row, count);
            grid.insert(grid.begin() + row, static_cast<size_t>(count),
                        std::vector<std::string>(static_cast<size_t>(cols)));
        } else if (operation == 1 && cols < 8) {
            table->InsertCols(col, count);
            for (auto& line : grid) line.insert(line.begin() + col, static_cast<size_t>(count), "");
            cols += count;
        } else if (operation == 2 && row + count <= rows) {
            table->DeleteRows(row, count);
            grid.erase(grid.begin() + row, grid.begin() + row + count);
        } else if (operation == 3 && col + count <= cols) {
            table->DeleteCols(col, count);
            for (auto& line : grid) line.erase(line.begin() + col, line.begin() + col + count);
            cols -= count;
        } else if (operation == 4 && row < rows) {
            table->ExchangeRows(row, 0);
            std::swap(grid[static_cast<size_t>(row)], grid[0]);
        } else if (operation == 5 && col < cols) {
            table->ExchangeCols(col, 0);
            for (auto& line : grid) std::swap(line[static_cast<size_t>(col)], line[0]);
        }
        ASSERT_EQ(table->GetRowCount(), static_cast<int>(grid.size()));
        ASSERT_EQ(table->GetColCount(), cols);
        for (size_t r = 0; r < grid.size(); ++r)
            for (size_t c = 0; c < grid[r].size(); ++c) {
                auto& cell = table->GetCell(static_cast<int>(r), static_cast<int>(c));
                ASSERT_EQ(cell.contentId, grid[r][c]);
                if (grid[r][c].empty())
                    grid[r][c] = cell.contentId = std::to_string(step * 100 + static_cast<int>(r * 10 + c));
            }
    }
    EXPECT_THROW(table->DeleteRows(table->GetRowCount(), 1), peru::CInvalidArgError);
    EXPECT_THROW(table->InsertCols(-1, 1), peru::CInvalidArgError);
}
