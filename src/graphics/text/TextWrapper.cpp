#include "graphics/text/TextWrapper.h"

namespace graphics {

std::string CTextWrapper::Wrap(const std::string& text, double maximalWidth) const {
    static constexpr const char* kDelimiters = " ,:-?..";
    std::string result;
    double width = 0;
    for (size_t begin = 0; begin < text.size();) {
        if (text[begin] == '\n') {
            result += '\n';
            width = 0;
            ++begin;
            continue;
        }
        // A piece ends with its delimiter, or before a line break.
        const size_t lineEnd = std::min(text.find('\n', begin), text.size());
        const size_t delimiter = text.find_first_of(kDelimiters, begin);
        const size_t end = delimiter < lineEnd ? delimiter + 1 : lineEnd;
        const std::string piece = text.substr(begin, end - begin);
        const double pieceWidth = m_measure(piece);
        if (width + pieceWidth > maximalWidth) {
            result += '\n';
            width = 0;
        }
        width += pieceWidth;
        result += piece;
        begin = end;
    }
    return result;
}

} // namespace graphics
