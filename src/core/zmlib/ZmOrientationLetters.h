/// \file
/// Anatomical labels of the four edges of a displayed image.
#pragma once

#include <zmlib/ZmExport.h>
#include <zmlib/ZmMat4f.h>
#include <zmlib/ZmVec3f.h>

#include <string>

/// The anatomical labels shown at the right, top, left and bottom edges of a view, derived from
/// the matrix that maps screen directions into the patient coordinate system, and the view's class
/// (axial, coronal, sagittal).
///
/// Patient axes: +x towards the patient's left (L), +y posterior (P), +z head (H); the opposite
/// letters are R, A and F. Screen x points right and screen y down, so `right` labels the screen
/// +x edge and `bottom` the screen +y edge; `left` and `top` hold their opposites. A label built
/// from a matrix is one letter; the two-string constructor also takes longer labels ("LP").
///
/// Matrices follow the library's row-vector convention: a direction d maps to `d * M` through the
/// upper 3x3 block, so row 0 of M is where screen x goes and row 1 where screen y goes.
///
/// A plain value owning four strings: copies are independent, and one object may be read from
/// several threads at once. Nothing fails: `isValid()` says whether the labels make sense.
class ZMLIB_API ZmOrientationLetters {
public:
    /// Four empty labels.
    ZmOrientationLetters();
    /// Labels of the screen-to-patient matrix \p m: each of screen x and screen y goes to the
    /// patient axis of its largest absolute component (the lowest axis on ties, with the positive
    /// letter for a zero component); screen y competes only on the axes screen x did not take.
    /// A degenerate matrix still gets labels: when screen y has nothing off screen x's axis (a zero
    /// row, or both rows along one axis) its remaining components are all zero and the tie rule
    /// gives it the x axis, which may be the one screen x took; the zero matrix gives "L/R/R/L",
    /// which is not `isValid()`. A matrix holding a NaN counts as the identity.
    explicit ZmOrientationLetters(const ZmMat4f& m);
    /// Labels of the chain `a * b * c` (\p a applied first, then \p b, then \p c), for a view
    /// whose screen-to-patient mapping is kept in parts, e.g. screen-to-world, world-to-volume and
    /// volume-to-patient. Same as the one-matrix form on the full 4x4 product; a NaN anywhere in
    /// the product makes it count as the identity.
    ZmOrientationLetters(const ZmMat4f& a, const ZmMat4f& b, const ZmMat4f& c);
    /// Labels given directly: \p right for the screen +x edge and \p bottom for the screen +y
    /// edge; `left` and `top` become their opposites, letter by letter. Characters other than the
    /// six letters are copied unchanged into the opposite (such labels are not `isValid()`).
    ZmOrientationLetters(const std::string& right, const std::string& bottom);
    ZmOrientationLetters(const ZmOrientationLetters&) = default;
    ZmOrientationLetters& operator=(const ZmOrientationLetters&) = default;
    ~ZmOrientationLetters() = default;

    const std::string& right() const noexcept { return m_right; }
    const std::string& top() const noexcept { return m_top; }
    const std::string& left() const noexcept { return m_left; }
    const std::string& bottom() const noexcept { return m_bottom; }

    /// The same object, or all four labels equal.
    bool operator==(const ZmOrientationLetters& o) const noexcept;
    bool operator!=(const ZmOrientationLetters& o) const noexcept { return !(*this == o); }

    /// Neither `right` nor `bottom` contains F or H. Like the two tests below it looks only at the
    /// letters present, so empty labels are all three at once (intended).
    bool isAxial() const noexcept;
    /// Neither `right` nor `bottom` contains A or P.
    bool isCoronal() const noexcept;
    /// Neither `right` nor `bottom` contains R or L.
    bool isSagittal() const noexcept;
    /// All four labels non-empty and made of the six letters only, and `right` neither equal to
    /// `bottom` nor to its opposite.
    bool isValid() const;

    /// `right + sep + top + sep + left + sep + bottom`.
    std::string join(char sep) const;

    /// The camera directions that show these labels: \p viewDir points from the viewer into the
    /// screen, `dir(right) x dir(bottom)` (screen x cross screen y, so the screen frame stays
    /// right-handed), and \p upDir towards the top edge, `dir(top)`. The direction of a label is
    /// the normalised sum of the unit axes of its letters. Both are mapped with \p m as directions
    /// (`multDirMatrix`) into the caller's frame and normalised: \p m maps patient to world, or,
    /// with \p mIsWorldToPatient, world to patient (its inverse is applied then). With the identity
    /// the labels of the identity matrix give view +z and up -y. Invalid labels, or labels whose
    /// directions do not span a plane (such as "LR", or "LP" against "PL"), give NaN in both.
    void getViewDirection(ZmVec3f& viewDir, ZmVec3f& upDir, const ZmMat4f& m, bool mIsWorldToPatient) const;

private:
    /// True when \p c occurs in neither `right` nor `bottom`.
    bool unusedLabel(char c) const noexcept;

    std::string m_right;
    std::string m_top;
    std::string m_left;
    std::string m_bottom;
};
