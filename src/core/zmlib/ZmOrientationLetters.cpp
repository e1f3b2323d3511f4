#include <zmlib/ZmOrientationLetters.h>

#include <cstring>

namespace {

// The patient directions +x, -x, +y, -y, +z, -z and, at the same positions, their opposites.
// Constant tables, so nothing has to run before first use.
constexpr char kLetters[] = "LRPAHF";
constexpr char kOpposites[] = "RLAPFH";

// The unit axes of the six letters, in the order of kLetters.
constexpr float kAxes[6][3] = {{1, 0, 0}, {-1, 0, 0}, {0, 1, 0}, {0, -1, 0}, {0, 0, 1}, {0, 0, -1}};

// Position of \p c in kLetters, or -1.
int letterIndex(char c)
{
    const char* p = c != 0 ? std::strchr(kLetters, c) : nullptr;
    return p != nullptr ? int(p - kLetters) : -1;
}

// Callers pass only the six letters; anything else is kept as it is rather than invented.
char opposite(char c)
{
    const int i = letterIndex(c);
    return i >= 0 ? kOpposites[i] : c;
}

std::string opposite(const std::string& s)
{
    std::string r(s);
    for (char& c : r) {
        c = opposite(c);
    }
    return r;
}

// The letter of patient axis \p axis for a component of sign \p v.
char letterOf(int axis, float v)
{
    return v < 0.0f ? kOpposites[2 * axis] : kLetters[2 * axis];
}

// The sum of the unit axes of the letters of \p label; only called on valid labels.
ZmVec3f labelDirection(const std::string& label)
{
    ZmVec3f d(0.0f, 0.0f, 0.0f);
    for (char c : label) {
        const int i = letterIndex(c);
        if (i < 0) {
            continue; // not a letter: contributes no axis
        }
        d += ZmVec3f(kAxes[i][0], kAxes[i][1], kAxes[i][2]);
    }
    return d;
}

} // namespace

ZmOrientationLetters::ZmOrientationLetters() = default;

ZmOrientationLetters::ZmOrientationLetters(const ZmMat4f& m)
{
    const ZmMat4f used = m.isNumber() ? m : ZmMat4f::identity();
    ZmVec3f x;
    ZmVec3f y;
    used.multDirMatrix(ZmVec3f(1.0f, 0.0f, 0.0f), x);
    used.multDirMatrix(ZmVec3f(0.0f, 1.0f, 0.0f), y);

    // The largest magnitude picks the patient axis; on ties the lower axis (indexOfMax).
    const int xAxis = x.abs().indexOfMax();
    // Screen y may not take the axis screen x took.
    const int yAxis = y.abs().compSwapped(unsigned(xAxis), 0.0f).indexOfMax();

    m_right.assign(1, letterOf(xAxis, x[xAxis]));
    m_left.assign(1, opposite(m_right[0]));
    m_bottom.assign(1, letterOf(yAxis, y[yAxis]));
    m_top.assign(1, opposite(m_bottom[0]));
}

ZmOrientationLetters::ZmOrientationLetters(const ZmMat4f& a, const ZmMat4f& b, const ZmMat4f& c)
    : ZmOrientationLetters(ZmMat4f(a).multRight(b).multRight(c))
{}

ZmOrientationLetters::ZmOrientationLetters(const std::string& right, const std::string& bottom)
    : m_right(right), m_top(opposite(bottom)), m_left(opposite(right)), m_bottom(bottom)
{}

bool ZmOrientationLetters::operator==(const ZmOrientationLetters& o) const noexcept
{
    return this == &o ||
           (m_right == o.m_right && m_top == o.m_top && m_left == o.m_left && m_bottom == o.m_bottom);
}

bool ZmOrientationLetters::unusedLabel(char c) const noexcept
{
    return m_right.find(c) == std::string::npos && m_bottom.find(c) == std::string::npos;
}

bool ZmOrientationLetters::isAxial() const noexcept
{
    return unusedLabel('F') && unusedLabel('H');
}

bool ZmOrientationLetters::isCoronal() const noexcept
{
    return unusedLabel('A') && unusedLabel('P');
}

bool ZmOrientationLetters::isSagittal() const noexcept
{
    return unusedLabel('R') && unusedLabel('L');
}

bool ZmOrientationLetters::isValid() const
{
    for (const std::string* s : {&m_right, &m_top, &m_left, &m_bottom}) {
        if (s->empty() || s->find_first_not_of(kLetters) != std::string::npos) {
            return false;
        }
    }
    return m_right != m_bottom && m_right != opposite(m_bottom);
}

std::string ZmOrientationLetters::join(char sep) const
{
    std::string r;
    r.reserve(m_right.size() + m_top.size() + m_left.size() + m_bottom.size() + 3);
    r += m_right;
    r += sep;
    r += m_top;
    r += sep;
    r += m_left;
    r += sep;
    r += m_bottom;
    return r;
}

void ZmOrientationLetters::getViewDirection(ZmVec3f& viewDir, ZmVec3f& upDir, const ZmMat4f& m,
                                            bool mIsWorldToPatient) const
{
    if (!isValid()) {
        viewDir.makeNaN();
        upDir.makeNaN();
        return;
    }
    // Sums of unit axes are small whole numbers, so the zero test below is exact.
    const ZmVec3f view = labelDirection(m_right).cross(labelDirection(m_bottom));
    const ZmVec3f up = labelDirection(m_top);
    if (view.isZero() || up.isZero()) {
        viewDir.makeNaN();
        upDir.makeNaN();
        return;
    }
    const ZmMat4f toWorld = mIsWorldToPatient ? m.inverse() : m;
    toWorld.multDirMatrix(view, viewDir);
    toWorld.multDirMatrix(up, upDir);
    viewDir.normalize();
    upDir.normalize();
}
