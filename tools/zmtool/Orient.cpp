// zmtool orient: the anatomical labels of the screen edges, and the view class, for a
// screen-to-patient matrix given entry by entry or built from rotations.
#include "zmtool.h"

#include <zmlib/ZmMat4f.h>
#include <zmlib/ZmOrientationLetters.h>
#include <zmlib/ZmRotation.h>
#include <zmlib/ZmVec3f.h>

#include <cerrno>
#include <cmath>
#include <cstdarg>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <string>
#include <vector>

namespace {

const char kUsage[] =
    "usage: zmtool orient M00 M01 M02 M03 M10 ... M33\n"
    "       zmtool orient --rotate AXIS,ANGLE [--rotate AXIS,ANGLE ...]\n"
    "Prints the labels of the right, top, left and bottom screen edges joined with '/' and the\n"
    "view class (axial, coronal or sagittal; none when the labels are not valid), e.g.\n"
    "\"L/A/R/P axial\". Patient axes: +x left (L), +y posterior (P), +z head (H).\n"
    "  M00 ... M33          the screen-to-patient matrix, 16 numbers row by row; a direction d\n"
    "                       maps to d*M, so row 0 is where screen x (right) goes and row 1 where\n"
    "                       screen y (down) goes\n"
    "  --rotate AXIS,ANGLE  a rotation by ANGLE degrees about AXIS: x, y, z or three numbers\n"
    "                       X,Y,Z (e.g. --rotate z,90 or --rotate 1,1,0,45); several rotations\n"
    "                       apply in the order given\n";

// One line saying what is wrong, then the usage; returns the exit status 2.
__attribute__((format(printf, 1, 2))) int usage(const char* format, ...)
{
    std::fputs("zmtool orient: ", stderr);
    va_list args;
    va_start(args, format);
    std::vfprintf(stderr, format, args);
    va_end(args);
    std::fprintf(stderr, "\n%s", kUsage);
    return 2;
}

// A finite number that also fits a float, as strtod reads it, with nothing before or after.
bool parseFloat(const char* text, float& out)
{
    if (text[0] == 0 || std::strchr(" \t\n\v\f\r", text[0]) != nullptr) {
        return false;
    }
    char* end = nullptr;
    const double v = std::strtod(text, &end);
    if (*end != 0 || !std::isfinite(v)) {
        return false;
    }
    const float f = static_cast<float>(v);
    if (!std::isfinite(f)) {
        return false;
    }
    out = f;
    return true;
}

std::vector<std::string> splitCommas(const char* text)
{
    std::vector<std::string> fields(1);
    for (const char* p = text; *p != 0; ++p) {
        if (*p == ',') {
            fields.emplace_back();
        } else {
            fields.back() += *p;
        }
    }
    return fields;
}

// Reads "AXIS,ANGLE" or "X,Y,Z,ANGLE" into a rotation matrix; 0 on success, else the exit status
// after the usage message.
int parseRotation(const char* spec, ZmMat4f& out)
{
    const std::vector<std::string> fields = splitCommas(spec);
    ZmVec3f axis(0.0f, 0.0f, 0.0f);
    if (fields.size() == 2) {
        const std::string& name = fields[0];
        if (name != "x" && name != "y" && name != "z") {
            return usage("'--rotate %s': the axis '%s' is not x, y or z", spec, name.c_str());
        }
        axis[name[0] - 'x'] = 1.0f;
    } else if (fields.size() == 4) {
        for (int i = 0; i < 3; ++i) {
            if (!parseFloat(fields[size_t(i)].c_str(), axis[i])) {
                return usage("'--rotate %s': '%s' is not a finite number", spec, fields[size_t(i)].c_str());
            }
        }
        if (axis.isZero()) {
            return usage("'--rotate %s': the axis must not be zero", spec);
        }
    } else {
        return usage("'--rotate %s': expected AXIS,ANGLE or X,Y,Z,ANGLE", spec);
    }
    float degrees = 0.0f;
    if (!parseFloat(fields.back().c_str(), degrees)) {
        return usage("'--rotate %s': the angle '%s' is not a finite number", spec, fields.back().c_str());
    }
    const double kPi = 3.14159265358979323846;
    out.setRotate(ZmRotation(axis, static_cast<float>(double(degrees) * kPi / 180.0)));
    return 0;
}

// Valid labels of a matrix use two different patient axes, so exactly one class applies.
const char* viewClass(const ZmOrientationLetters& letters)
{
    if (!letters.isValid()) {
        return "none";
    }
    return letters.isAxial() ? "axial" : letters.isCoronal() ? "coronal" : "sagittal";
}

} // namespace

int zmtool::runOrient(int argc, char** argv)
{
    std::vector<const char*> entries;
    ZmMat4f matrix = ZmMat4f::identity();
    bool rotated = false;
    for (int i = 0; i < argc; ++i) {
        const char* a = argv[i];
        if (std::strcmp(a, "--help") == 0 || std::strcmp(a, "-h") == 0) {
            std::fputs(kUsage, stdout);
            return 0;
        }
        if (std::strcmp(a, "--rotate") == 0) {
            if (i + 1 >= argc) {
                return usage("--rotate needs AXIS,ANGLE");
            }
            ZmMat4f r;
            const int status = parseRotation(argv[++i], r);
            if (status != 0) {
                return status;
            }
            matrix.multRight(r); // the rotation given first is applied first
            rotated = true;
        } else if (std::strncmp(a, "--", 2) == 0) {
            return usage("unknown option '%s'", a);
        } else {
            entries.push_back(a); // negative numbers start with '-', so only "--" marks an option
        }
    }
    if (rotated && !entries.empty()) {
        return usage("'%s': matrix entries cannot be combined with --rotate", entries[0]);
    }
    if (!rotated) {
        if (entries.empty()) {
            return usage("needs 16 matrix entries or --rotate AXIS,ANGLE");
        }
        if (entries.size() != 16) {
            return usage("expected 16 matrix entries, got %zu", entries.size());
        }
        float m[4][4];
        for (int k = 0; k < 16; ++k) {
            if (!parseFloat(entries[size_t(k)], m[k / 4][k % 4])) {
                return usage("'%s' is not a finite number (matrix entry M%d%d)", entries[size_t(k)], k / 4,
                             k % 4);
            }
        }
        matrix.setValue(m);
    }

    const ZmOrientationLetters letters(matrix);
    std::printf("%s %s\n", letters.join('/').c_str(), viewClass(letters));
    if (std::fflush(stdout) != 0 || std::ferror(stdout)) {
        std::fprintf(stderr, "zmtool orient: cannot write the output: %s\n", std::strerror(errno));
        return 1;
    }
    return 0;
}
