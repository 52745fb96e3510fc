#include "peru/xml/XmlDocument.h"

#include "peru/streams/IStreamManager.h"
#include "peru/streams/MemoryIOStream.h"
#include "peru/streams/StringStreams.h"
#include "peru/strings/CharEncodingRules.h"
#include "peru/strings/StringFormat.h"
#include "support/Files.h"
#include "support/Process.h"
#include "support/TempFolder.h"

using namespace peru;
using tests::errorOf;
using tests::text;
using namespace peru::literals;

namespace {

P<CStringInStream> streamOf(std::string_view bytes) {
    return make<CStringInStream>(make<CUTF8String>(bytes.data(), static_cast<int32_t>(bytes.size())));
}

P<CXmlDocument> parse(std::string_view bytes) {
    auto document = make<CXmlDocument>();
    document->parse(streamOf(bytes));
    return document;
}

std::string print(const P<CXmlDocument>& document) {
    auto out = make<CMemoryIOStream>();
    document->print(out);
    return {reinterpret_cast<const char*>(out->getBlock()->getData()), static_cast<size_t>(out->getSize())};
}

std::string repeat(std::string_view text, int count) {
    std::string all;
    for (int i = 0; i < count; ++i) all += text;
    return all;
}

bool accepts(const std::function<void()>& change) {
    try {
        change();
        return true;
    } catch (const CException&) {
        return false;
    }
}

std::string asUTF16(std::u16string_view units, bool bigEndian) {
    std::string bytes = bigEndian ? "\xFE\xFF" : "\xFF\xFE";
    for (char16_t unit : units) {
        bytes += static_cast<char>(bigEndian ? unit >> 8 : unit & 0xFF);
        bytes += static_cast<char>(bigEndian ? unit & 0xFF : unit >> 8);
    }
    return bytes;
}

} // namespace

TEST(XmlDocument, parse_ReadsWhatOtherProgramsWrite) {
    const struct {
        std::string bytes;
        const char* rootText;
    } cases[] = {
        {"<a>x</a>", "x"},
        {"\xEF\xBB\xBF<?xml version='1.0'?>\r\n<!DOCTYPE a>\n<!-- > --><a  >x</a >\n<!-- end -->", "x"},
        {"<a>\n    one\n    two </a>", "one two"},
        {"<a>&#x20;&lt;b&gt; &amp;amp; &#65;&#x1F600;</a>", " <b> &amp; A\xF0\x9F\x98\x80"},
        {"<a>x<![CDATA[ <b> ]]>y<!-- c --><b>z</b></a>", "x <b> y"},
        {"<?go on?><a b='>' c='/>'/>", ""},
        {"<?xml version = \"1.0\"\nstandalone='yes' ?><?xml-stylesheet href='b c.xsl?d=e'?><a>x</a>", "x"},
        {"<?xml version='1.0' encoding='ISO-8859-1'?><a>gr\xFC\xDF</a>", "gr\xC3\xBC\xC3\x9F"},
        {"\xEF\xBB\xBF<?xml version='1.0' encoding='ISO-8859-1'?><a>\xC3\x9F</a>", "\xC3\x9F"},
        {asUTF16(u"<?xml version='1.0' encoding='UTF-16'?><a>\u00DF\U0001F600</a>", false),
         "\xC3\x9F\xF0\x9F\x98\x80"},
        {asUTF16(u"<a>\u0915</a>", true), "\xE0\xA4\x95"},
    };
    for (const auto& c : cases)
        EXPECT_EQ(text(parse(c.bytes)->getRootNode()->getText()), c.rootText) << c.bytes;
    const auto marked = make<CXmlDocument>();
    marked->parseString(newString(u"\uFEFF<a>\u0915</a>"));
    EXPECT_EQ(text(marked->getRootNode()->getText()), "\xE0\xA4\x95");
    EXPECT_FALSE(parse("<?xml version=\"1.0\" encoding=\"utf-8\"?>")->getRootNode());
}

TEST(XmlDocument, parse_NamesLineAndFaultOfBadDocuments) {
    std::vector<std::pair<std::string, std::string>> cases = {
        // a document and the end of its message
        {"<a>\n\xFF</a>", "is not in a known encoding, such as valid UTF-8, line 2."},
        {"<a>\xF0\x9F\x98", "such as valid UTF-8, line 1."},
        {"<?xml version='1.0' encoding='ISO-8859-15'?><a>\xA4</a>", "such as valid UTF-8, line 1."},
        {asUTF16(u"<a>\n", false) + "\x3D\xD8", "such as valid UTF-8, line 2."},
        {asUTF16(u"<a>\n", false) + "\x3D", "such as valid UTF-8, line 2."},
        {asUTF16(u"<a>\n\xD83D\xD83D", true), "such as valid UTF-8, line 2."},
        {repeat("<a>", 257) + repeat("</a>", 257), "too many attributes in one element, line 1."},
    };
    const std::pair<int, std::vector<std::string>> syntax[] = {
        {1,
         {"",
          "<!DOCTYPE a [<!ENTITY b 'c'>]>\n<a/>",
          "<a b='&#x110000;'/>",
          "<a>&#" + repeat("1", 100) + ";</a>",
          "<?xmlencoding=\"?><a b=\"\"/>",
          "<?xml version='1.0?><a b=''/>",
          "<?XML version='1.0' encoding?><a/>",
          "<?xml-a title='an encoding'?><a/>",
          "<?xml a='b\"c'?><a/>",
          "<?xml a='b'c='d'?><a/>",
          "<?xml a='b?><a c=''/>",
          "<?xml a b='c'?><a/>",
          "<?go",
          "<?go > ?><a/>",
          "<!doctype a><a/>",
          "<!DOCTYPE a \"><a b='\"'/>",
          "<!DOCTYPE a '><a b=\"'\"/>",
          "<!DOCTYPE a",
          "<a/><!DOCTYPE a>",
          "<a><!DOCTYPE a></a>",
          "<![CDATA[a]]><a/>",
          "<a",
          "<a/ >",
          "<a b>",
          "<a b/>",
          "<a b=1/>",
          "<a b='1/>",
          "<a b='1'c='2'/>",
          "<a =''/>",
          "<a></>",
          "<a></a b>",
          "<a></a",
          "</a>",
          "<a>&#x;</a>",
          "<a>&#;</a>",
          "<a>&#X41;</a>",
          "<a>&#65</a>",
          "<a>&#65",
          "<a>&amp</a>",
          "<a>&a;</a>",
          "<a>&;</a>",
          "<a>&#-1;</a>",
          "<a>&#65;&</a>",
          "<?xml a=' STANDALONE'?><a/>"}},
        {2,
         {"<a>\n<b c='1' c='2'/></a>", "<a>\n<b c='<'/></a>", "<a/>\n<b/>", "<a/>\ntext", "<a>\n</a></a>",
          "<a>\n<![CDATA[ ]] </a>", "<a>\n&#0;</a>", "<a>\nrock & roll</a>", "<a b='\n&nbsp;'/>",
          "\n<\xEF\xBB\xBFx/>", std::string("<a>\n\0</a>", 9)}},
        {3, {"<a>\n<b>\n</a>\n</b>", "<a>\r<b>\r", "<a>\n\n<!-- </a>"}},
    };
    for (const auto& [line, documents] : syntax)
        for (const std::string& bytes : documents)
            cases.emplace_back(bytes, "XML Parse Error, line " + std::to_string(line) + ".");
    for (const auto& [bytes, end] : cases) {
        const auto document = parse("<kept/>");
        const std::string message = errorOf<CParseError>([&] { document->parse(streamOf(bytes)); });
        EXPECT_TRUE(message.ends_with(end)) << message << "\n" << bytes.substr(0, 80);
        EXPECT_EQ(text(document->getRootNode()->getName()), "kept");
    }
    std::string wide = "<a";
    for (int i = 0; i <= IXmlDocument::kMaxProperties; ++i) wide += " a" + std::to_string(i) + "=''";
    EXPECT_THROW(parse(wide + "/>"), CParseError);
    parse(repeat("<a>", IXmlDocument::kMaxDepth) + repeat("</a>", IXmlDocument::kMaxDepth));

    const tests::CTempFolder folder;
    const P<IURI> file = tests::toURI(folder.write("list.xml", "<a>\n<b>"));
    EXPECT_EQ(errorOf([&] { make<CXmlDocument>()->parse(getStreamManager()->getInStream(file)); }),
              "XML Parse Error in file '" + text(file->getAsString()) + "', line 2.");
}

TEST(XmlDocument, print_TextsComeBackAndPeersReadThem) {
    const std::string texts[] = {
        "plain",
        "a < b && c > 'd' \"e\"",
        "&#x41; &amp;",
        "  two  blanks  ",
        "\n\tlines\r\nand tabs\n",
        "]]>",
        "\xF0\x9F\x98\x80 \xE0\xA4\x95 \xC3\xBC",
        " ",
        "\r\n",
        "\xEF\xBB\xBFmark\xEF\xBB\xBF",
    };
    for (const char* encoding : {"UTF-8", "utf-16"}) {
        auto document = make<CXmlDocument>("1.0", encoding);
        const P<IXmlNode> root = document->addChildNode("root");
        for (const std::string& each : texts) {
            const P<IXmlNode> node = root->addChildNode("text");
            node->setText(CString::fromUTF8(each));
            node->setProperty("value", CString::fromUTF8(each));
        }
        root->addChildNode("empty");
        // Text beside elements.
        root->addChildNode("mixed")->addChildNode("inner");
        root->getChildNode("mixed")->setText(" m ");

        const std::string printed = print(document);
        const auto again = parse(printed);
        WEnum<IXmlNode> nodes = again->getRootNode()->getChildNodesByName("text");
        EXPECT_EQ(nodes.getCount(), 10);
        for (const std::string& each : texts) {
            const P<IXmlNode> node = nodes.getNext();
            EXPECT_EQ(text(node->getText()->toUTF16String()->toUTF8String()), each);
            EXPECT_EQ(text(node->getProperty("value")->getValue()->toUTF8String()), each);
        }
        EXPECT_EQ(text(again->getRootNode()->getChildNode("mixed")->getText()), " m ");
        const auto fromString = make<CXmlDocument>("1.0", encoding);
        fromString->parseString(document->printToString());
        EXPECT_EQ(print(fromString), printed);

        const tests::CTempFolder folder;
        const std::string file = folder.write("out.xml", printed).string();
        for (size_t i = 0; i < std::size(texts) - 2; ++i) {
            const std::string place = "/root/text[" + std::to_string(i + 1) + "]";
            const auto judged =
                tests::run({"xmllint", "--xpath", "concat(" + place + ",'|'," + place + "/@value)", file});
            EXPECT_EQ(judged.out, texts[i] + "|" + texts[i] + "\n") << judged.err;
        }
    }
    // The same text again, with each kind of content in its place.
    const std::string own =
        "<?xml version=\"1.1\" encoding=\"UTF-8\" ?>\n<!-- first -->\n<!DOCTYPE a \"b\" 'c'>\n"
        "<a b=\"1\" c=\"&quot;&apos; &lt;&gt;&amp;  .\">\n    <!-- c -->\n"
        "    <d>t<e><f /></e><!-- g --><h>u</h>v</d>\n    <i>\n        <j />\n    </i>\n"
        "    <k><![CDATA[<&]]></k>\n    <l>&#x20;\xEF\xBC\x81 m &#x20;n&#x20;</l>\n</a>\n<!-- last -->\n";
    const auto document = make<CXmlDocument>("1.1", "utf-8");
    document->parse(streamOf(own));
    EXPECT_EQ(print(document), std::string(own).replace(30, 5, "utf-8"));
}

TEST(XmlDocument, nodes_ReadAndChangeTheirParts) {
    const auto document = parse("<a p='1' q='2'>x<b/>y<c/><b r='3'/></a>");
    const P<IXmlNode> root = document->getRootNode();
    EXPECT_EQ(document->getChildNode("a"), root);
    EXPECT_FALSE(document->getChildNode("b"));
    for (WEnum<IXmlNode> nodes : {document->getChildNodes(), document->getChildNodesByName("a")}) {
        EXPECT_EQ(nodes.getNext(), root);
        EXPECT_THROW(nodes.getNext(), CEndOfEnumError);
    }
    EXPECT_EQ(document->getChildNodesByName("b").getCount(), 0);
    EXPECT_FALSE(document->getProperty("p"));
    EXPECT_FALSE(document->getProperties().hasMore());
    EXPECT_THROW(document->setProperty("p", "2"), CMethodNotImplementedError);
    EXPECT_EQ(document->getDocument(), document);
    EXPECT_FALSE(root->getProperty("r"));
    EXPECT_EQ(text(root->getText()), "xy");
    root->setText("z<");
    WEnum<IXmlProperty> properties = root->getProperties();
    for (const char* name : {"p", "q"}) {
        const P<IXmlProperty> property = properties.getNext();
        EXPECT_EQ(text(property->getName()), name);
        property->setValue(CString::fromUTF8("<" + text(property->getValue())));
        EXPECT_THROW(property->setValue("\x01"), CInvalidArgError);
    }
    EXPECT_THROW(properties.getNext(), CEndOfEnumError);
    root->removeChildNode(root->getChildNode("c"));
    root->getChildNode("b")->setText("t");
    EXPECT_TRUE(print(document).ends_with("<a p=\"&lt;1\" q=\"&lt;2\">z&lt;<b>t</b><b r=\"3\" /></a>\n"));
    root->removeProperty("p");
    root->getChildNode("b")->setText("");
    root->setText("");
    EXPECT_TRUE(print(document).ends_with("<a q=\"&lt;2\">\n    <b />\n    <b r=\"3\" />\n</a>\n"));
    EXPECT_THROW(document->removeChildNode(root->getChildNode("b")), CInvalidArgError);
    EXPECT_THROW(document->removeChildNode(nullptr), CInvalidArgError);
    document->removeChildNode(root);
    EXPECT_THROW(root->getName(), CInvalidObjectStateError);
    EXPECT_FALSE(document->getRootNode());
    EXPECT_THROW(document->parseString(nullptr), CParseError);
}

TEST(XmlDocument, characters_AtTheLimitsOfTheirRanges) {
    constexpr std::pair<char32_t, char32_t> kValid[] = {
        {0x9, 0xA}, {0xD, 0xD}, {0x20, 0xD7FF}, {0xE000, 0xFFFD}, {0x10000, 0x10FFFF}};
    std::map<char32_t, bool> cases;
    for (const auto& [first, last] : kValid)
        cases.merge(
            std::map<char32_t, bool>{{first, true}, {last, true}, {first - 1, false}, {last + 1, false}});
    for (const auto& [ch, valid] : cases) {
        SCOPED_TRACE(static_cast<uint32_t>(ch));
        uint8_t utf8[4];
        const std::string raw(reinterpret_cast<char*>(utf8),
                              static_cast<size_t>(SUTF8Rules::write(ch, utf8)));
        std::u16string units(1, static_cast<char16_t>(ch < 0x10000 ? ch : 0xD7C0 + (ch >> 10)));
        if (ch >= 0x10000) units += static_cast<char16_t>(0xDC00 + (ch & 0x3FF));
        const auto code = static_cast<int32_t>(ch);
        std::vector<std::string> documents{"<a>x" + raw + "x</a>", asUTF16(u"<a>x" + units + u"x</a>", false),
                                           asUTF16(u"<a>x" + units + u"x</a>", true)};
        for (const char* form : {"<a>x&#%d;x</a>", "<a>x&#x%x;x</a>", "<a>x&#x%X;x</a>"})
            documents.push_back(text(format(form, code)));
        for (const std::string& each : documents)
            EXPECT_EQ(accepts([&] {
                          EXPECT_EQ(text(parse(each)->getRootNode()->getText()),
                                    "x" + (each[4] != '&' && ch < 0x20 ? " " : raw) + "x");
                      }),
                      valid)
                << each;
        const P<IXmlNode> node = make<CXmlDocument>()->addChildNode("a");
        EXPECT_EQ(accepts([&] { node->setText(CString::fromUTF8(raw)); }), valid);
    }
    const P<IXmlNode> node = make<CXmlDocument>()->addChildNode("a");
    for (int i = 1; i < 0x80; ++i) {
        const std::string ch(1, static_cast<char>(i));
        const bool start = std::isalpha(i) || ch == "_";
        const bool part = start || std::isdigit(i) || std::string("-.:").find(ch) != std::string::npos;
        const bool blank = std::string(" \t\r\n").find(ch) != std::string::npos;
        EXPECT_EQ(accepts([&] { node->addChildNode(CString::fromUTF8(ch)); }), start) << ch;
        EXPECT_EQ(accepts([&] { node->addChildNode(CString::fromUTF8("a" + ch)); }), part) << ch;
        EXPECT_EQ(accepts([&] { parse("<" + ch + "/>"); }), start) << ch;
        EXPECT_EQ(accepts([&] { parse("<a" + ch + "/>"); }), part || blank) << ch;
        EXPECT_EQ(accepts([&] { parse("<a " + ch + "=''/>"); }), start) << ch;
    }
}

TEST(XmlDocument, nodes_OutliveTheDocumentButNotTheirRemoval) {
    P<CXmlDocument> document = parse("<a><b p='1'><c/></b><b/><d/></a>");
    const P<IXmlNode> root = document->getRootNode();
    document.reset();
    const P<IXmlNode> b = root->getChildNode("b");
    const P<IXmlNode> c = b->getChildNode("c");
    const P<IXmlProperty> p = b->getProperty("p");
    EXPECT_EQ(b, root->getChildNodes().getNext());

    WEnum<IXmlNode> nodes = root->getChildNodes();
    EXPECT_EQ(nodes.getCount(), 3);
    EXPECT_THROW(root->removeChildNode(c), CInvalidArgError);
    root->removeChildNode(b);
    EXPECT_THROW(b->getName(), CInvalidObjectStateError);
    EXPECT_THROW(c->addChildNode("x"), CInvalidObjectStateError);
    EXPECT_THROW(p->getValue(), CInvalidObjectStateError);
    EXPECT_THROW(nodes.getNext(), CInvalidObjectStateError);

    root->getDocument()->parseString("<new/>"_s);
    EXPECT_THROW(root->getText(), CInvalidObjectStateError);
}

TEST(XmlDocument, changes_ThatCouldNotBeReadAgainAreRefused) {
    auto document = make<CXmlDocument>();
    P<IXmlNode> node = document->addChildNode("a");
    EXPECT_THROW(document->addChildNode("b"), CInvalidArgError);
    EXPECT_TRUE(document->getName()->isEmpty() && document->getText()->isEmpty());
    EXPECT_THROW(document->setText("a"), CMethodNotImplementedError);
    for (const char16_t* name : {u"", u"a<", u"\uFEFFa"}) {
        EXPECT_THROW(node->addChildNode(name), CInvalidArgError) << text(newString(name));
        EXPECT_THROW(node->setProperty(name, ""), CInvalidArgError) << text(newString(name));
    }
    EXPECT_THROW(node->setText(CString::fromUTF8("\xFF")), CInvalidArgError);
    for (int i = 0; i < IXmlDocument::kMaxProperties; ++i) node->setProperty(format("p%d", i), "");
    node->setProperty("p0", "changed");
    EXPECT_THROW(node->setProperty("one", "more"), CInvalidArgError);
    for (int i = 1; i < IXmlDocument::kMaxDepth; ++i) node = node->addChildNode("a");
    EXPECT_THROW(node->addChildNode("a"), CInvalidArgError);
    parse(print(document));
    for (const char* version : {"1.0", "1.2"})
        EXPECT_THROW(make<CXmlDocument>(version, version[2] == '0' ? "KOI8-R" : "UTF-8"), CInvalidArgError);
}
