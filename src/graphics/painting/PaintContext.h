// What elements paint with.
#pragma once

#include "graphics/painting/IGraphicsContext.h"

namespace graphics {

enum class EColourMode { coloured, grey };

enum class EOutputKind {
    screen,  // with aids for editing: the paper and hints of empty elements
    paper,   // what is printed
    picture, // the same in a file or a thumbnail
};

// A graphics context with the transform from model space to the device. Lives for one paint call.
class GRAPHICS_API CPaintContext {
public:
    CPaintContext(IGraphicsContext& graphics, const CMatrix& matrix,
                  EColourMode colourMode = EColourMode::coloured,
                  EOutputKind outputKind = EOutputKind::picture);
    CPaintContext(const CPaintContext&) = delete;
    CPaintContext& operator=(const CPaintContext&) = delete;

    // With the current matrix set.
    IGraphicsContext& GetGraphics() const { return m_graphics; }
    const CMatrix& GetMatrix() const { return m_matrix; }
    EColourMode GetColourMode() const { return m_colourMode; }
    EOutputKind GetOutputKind() const { return m_outputKind; }
    // Whether a rectangle in the coordinates of the current matrix can be seen on the device.
    bool CanSee(const SRect& rect) const;
    // How many off-screen pictures this context is painted into; limits documents that contain themselves.
    int GetDepth() const { return m_depth; }
    void SetDepth(int depth) { m_depth = depth; }

    // Multiplies a matrix into the context's and restores the old one at the end of the scope. Without
    // colour, all that is painted inside is grey.
    class GRAPHICS_API CScope {
    public:
        CScope(CPaintContext& context, const CMatrix& first, bool isColoured = true);
        ~CScope();
        CScope(const CScope&) = delete;
        CScope& operator=(const CScope&) = delete;

    private:
        CPaintContext& m_context;
        const CMatrix m_oldMatrix;
        const EEffect m_oldEffect;
    };

private:
    void setMatrix(const CMatrix& matrix);

    IGraphicsContext& m_graphics;
    CMatrix m_matrix;
    const EColourMode m_colourMode;
    const EOutputKind m_outputKind;
    const SRect m_clipBox;
    int m_depth = 0;
};

} // namespace graphics
