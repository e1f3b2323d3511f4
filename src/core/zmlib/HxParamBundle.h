/// \file
/// The inner nodes of a parameter tree, with the product's DICOM conventions.
#pragma once

#include <zmlib/HxParamBase.h>
#include <zmlib/HxParameter.h>
#include <zmlib/ZmDArray.h>
#include <zmlib/ZmResult.h>

#include <atomic>
#include <cstdint>
#include <cstdio>

class ZmString;

/// A named node owning sub-bundles and parameters: all sub-bundles come first, then all
/// parameters, each group in insertion order. Names are looked up with `compareNames` (ASCII
/// case-insensitive, the key ending at its first space); a key beginning with a digit is looked
/// up as "_" + key, as `setName` stores such names.
///
/// **Lookup.** `find` scans the parameters (never the sub-bundles), by binary search once they
/// are sorted (`sortParameters`, `findSorted`; every insertion clears the sorted state). Its type
/// mask holds receiving capacities: 0x01 byte, 0x02 short, 0x04 int, 0x08 float, 0x10 double,
/// 0x40 string; a parameter is accepted when the mask has a bit at least as wide as its type
/// (byte < short = ushort < int < float < double < string). Complex, uint and sbyte parameters are
/// never found by `find` and the typed shortcuts built on it, as it always has been.
///
/// **Typed shortcuts** return 1 when a suitable parameter filled the output, else 0 with the
/// output untouched. They accept any type (mask 255) and any dimension unless they say otherwise.
/// A text parameter is parsed: for `findNum`/`findReal` with n values each value is the number at
/// the current place (a text exhausted early gives 0 for the rest; `findNum` reads the decimal
/// integer and skips its digits and "-" signs, then spaces); a numeric parameter must have exactly
/// n elements (one for the single-value forms) and converts with `getNum`/`getReal`.
///
/// **Text form** (`print`): "name {", one line per child indented by four spaces a level, "}".
/// A parameter line is its name, a space and its value; text values are quoted, with inner double
/// quotes written as \" and a space added before the closing quote when the text ends in a
/// backslash. Hidden children (flag 0x0080) are never printed; transient ones (0x0001) are left
/// out of FILE output. In FILE output a parameter that has a later non-transient sibling ends with
/// ","; output into a `ZmString` has no commas at all. Both asymmetries are kept on purpose: data
/// files have always been written this way.
///
/// **DICOM.** Attributes are text parameters of the bundle "DICOM"/"All" named "G%04X-%04X"
/// (upper-case hex) holding "label: value". An "All" bundle with a sub-bundle "G5200-9230"
/// (per-frame functional groups) is an enhanced multi-frame data set: tags are then mapped with
/// `replaceTag` and searched depth-first in child order below "G5200-9230", then below
/// "G5200-9229" (shared functional groups). Private tags are resolved through the transient
/// bundle "PrivateCreators", built from the creator attributes of "All" on first need.
///
/// Not thread-safe, except that concurrent lazy sorts (`findSorted`) take a spin lock.
class ZMLIB_API HxParamBundle : public HxParamBase {
public:
    explicit HxParamBundle(const char* name);
    HxParamBundle(const HxParamBundle& other);
    /// Takes the children of \p other (which keeps its name and ends empty). Not noexcept: the
    /// name is copied, which allocates.
    HxParamBundle(HxParamBundle&& other); // NOLINT(performance-noexcept-move-constructor)
    /// The base assignment, then the children destroyed and \p other's deep-copied.
    HxParamBundle& operator=(const HxParamBundle& other);
    /// The base assignment, then the children destroyed and \p other's moved in.
    HxParamBundle& operator=(HxParamBundle&& other); // NOLINT(performance-noexcept-move-constructor)
    ~HxParamBundle() override;

    /// A new empty bundle owned by the caller.
    static HxParamBundle* create(const char* name);
    HxParamBase* duplicate() const override;

    // --- children ------------------------------------------------------------------------------

    /// All children.
    int size() const noexcept { return int(m_children.size()); }
    int nBundles() const noexcept { return int(m_bundleCount & kCountMask); }
    /// The child at \p i (0 to size() - 1, sub-bundles first).
    HxParamBase* operator[](int i) const noexcept { return m_children[i]; }
    /// The i-th sub-bundle, null outside 0 to nBundles() - 1.
    HxParamBundle* bundle(int i) const noexcept;
    /// The position of \p node among all children, -1 for null or a node of another bundle.
    int index(const HxParamBase* node) const noexcept;
    /// Takes ownership of \p node. A bundle named exactly "BoundaryIds" gets the text parameter
    /// "name" = "BoundaryConditions" and one named "BoundaryConditions" gets "BoundaryIds" (the two
    /// names point at each other on purpose). With \p replace non-zero a child of the same kind
    /// and name is replaced in place (the new node takes its flags as well); otherwise the node is
    /// added at the end of its group.
    void insert(HxParamBase* node, int replace);
    /// Destroys \p node unless it has flag 0x0004 (then nothing happens, silently).
    void remove(HxParamBase* node);
    /// Removes what `findBase` finds.
    void remove(const char* name);
    /// Destroys every child.
    void removeAll();
    /// Takes every child of \p source, which ends empty: an empty bundle exchanges its children
    /// with \p source, otherwise they are inserted with replace = 1.
    void move(HxParamBundle& source);
    /// Merges \p source into this bundle, skipping nodes with flag 0x0002: a parameter is
    /// duplicated and inserted; a bundle's children are appended when this bundle was empty,
    /// otherwise sub-bundles of known names are merged recursively and everything else replaces.
    /// Copying a bundle into itself does nothing.
    void copy(const HxParamBase& source);
    /// As `copy`, without the flag test and the empty-target shortcut, and carrying each child's
    /// edit check over to its duplicate.
    void copyAll(const HxParamBase& source);
    /// Sorts the parameters (not the sub-bundles) by name under the spin lock.
    void sortParameters();
    /// Clears the bits of \p mask in the whole subtree.
    void untouchAll(int mask);

    // --- lookup --------------------------------------------------------------------------------

    /// A parameter of that name, dimension (\p dim >= 1 must match, else any) and a type the mask
    /// accepts; the first match, or null.
    HxParameter* find(const char* name, int dim = 0, int typeMask = 255) const;
    /// A sub-bundle or a parameter of that name (sub-bundles first).
    HxParamBase* findBase(const char* name) const;
    /// `find` after sorting the parameters when they are not sorted.
    HxParameter* findSorted(const char* name);
    /// A parameter of that name here or in any sub-bundle, depth-first in child order.
    HxParameter* findRecursive(const char* name) const;
    /// The sub-bundle of that name, else the first whose "Name" parameter holds the name among
    /// its first 16 words; else, with \p create, a new empty bundle of that name; else null.
    HxParamBundle* bundle(const char* name, int create);
    HxParamBundle* bundle(const char* name) const;

    // --- typed shortcuts -----------------------------------------------------------------------

    int findNum(const char* name, int& value) const;
    int findNum(const char* name, int n, int* values) const;
    int findReal(const char* name, float& value) const;
    int findReal(const char* name, double& value) const;
    int findReal(const char* name, int n, float* values) const;
    int findReal(const char* name, int n, double* values) const;
    /// Any parameter's `getString()`.
    int findString(const char* name, const char*& value) const;
    /// Three components 0..1 from a numeric parameter of three elements or a text: three numbers,
    /// "#RRGGBB", or a colour name (black, white, red, green, blue, yellow, cyan, magenta,
    /// gray/grey, orange, brown, pink, purple; any case).
    int findColor(const char* name, float color[3]) const;
    /// The parameter "Color".
    int findColor(float color[3]) const;
    /// Sets "Color" to three floats.
    void setColor(const float color[3]);

    // --- setting by name (replaces or creates a parameter) ---------------------------------------

    void set(const char* name, const char* text);
    void set(const char* name, int value);
    void set(const char* name, double value);
    void set(const char* name, int n, const int* values);
    void set(const char* name, int n, const float* values);
    void set(const char* name, int n, const double* values);
    /// The n integers in decimal joined by single spaces, as one text parameter.
    void setAsString(const char* name, int n, const int* values);

    // --- well-known sub-bundles ------------------------------------------------------------------

    HxParamBundle* boundaryIds(int create);
    HxParamBundle* materials(int create);
    /// The bundle "All" inside "DICOM", or null.
    HxParamBundle* dicomAll() const;
    /// The same, made when missing.
    HxParamBundle* dicomAllCreate();

    // --- DICOM -----------------------------------------------------------------------------------
    // Tags are parameter names "GGGGG-EEEE" ("G0028-0030"); `replaceTag` also reads "(0028,0030)".

    /// The value of \p tag in "DICOM"/"All", else \p dflt.
    const char* findTag(const char* tag, const char* dflt) const;
    /// The value as one number (the first of a multi-valued text).
    int findTag(const char* tag, float& value) const;
    /// The values of a multi-valued text, split at backslashes (DICOM's separator); 0 with
    /// \p values untouched unless every value is a number.
    int findTag(const char* tag, ZmDArray<float>& values) const;
    /// The same lookups applied to an "All" bundle itself (enhanced multi-frame sets included).
    const char* findTagInAll(const char* tag, const char* dflt) const;
    int findTagInAll(const char* tag, float& value) const;
    int findTagInAll(const char* tag, ZmDArray<float>& values) const;
    int findTagInAll(const char* tag, int& value) const;
    /// Stores "label: value" as ": " + \p value in "DICOM"/"All", making both bundles if needed.
    void setTag(const char* tag, const char* value);
    /// A private attribute of \p creator: \p tag's block digits (characters 6-7) are replaced by
    /// the creator's block.
    const char* findPrivateTag(const char* creator, const char* tag, const char* dflt);
    const char* findPrivateTagInAll(const char* creator, const char* tag, const char* dflt);
    /// Sets (or with a null \p value removes) a private attribute; an unknown creator gets the
    /// lowest free block from 0x10 of its group (none above 0xFF: nothing happens). Block digits
    /// are written by adding them to '0', as they always have been, so 10 to 15 give ':' to '?',
    /// which the name rules store as '_': of the blocks that then share a name, only the first is
    /// given out.
    void setPrivateTagInAll(const char* creator, const char* tag, const char* value);
    /// The sub-bundle "Item_<item>" of the private sequence \p tag, or null.
    HxParamBundle* privateSequenceItemInAll(const char* creator, const char* tag, int item) const;
    /// The same; with \p create the bundles (and the creator's block) are made when missing, the
    /// sequence gets "Description" = \p description when it has none and a new item gets
    /// "Description" = "Item <item>".
    HxParamBundle* privateSequenceItemInAll(const char* creator, const char* tag, const char* description,
                                            int item, bool create);
    /// Whether this "All" bundle is an enhanced multi-frame set: the "G5200-9230" sub-bundle into
    /// \p perFrame and "G5200-9229" (may be null) into \p shared (either output may be null);
    /// both are cleared first.
    bool isEnhancedDcm(const HxParamBundle** perFrame, const HxParamBundle** shared) const;
    /// \p tag in the functional groups of this enhanced "All" bundle, else \p dflt.
    const char* findTagInEnhancedDicomBundle(const char* tag, const char* dflt) const;
    /// Maps a classic tag to its enhanced multi-frame counterpart ((0018,0081) -> (0018,9082),
    /// (0008,0008) -> (0008,9007), (0020,0060) -> (0020,9072), (0008,002A) -> (0018,9074),
    /// (0020,0100) -> (0020,9128), (0018,1060) -> (0020,9153)); false for other or unreadable tags.
    static bool replaceTag(const ZmString& in, ZmString& out);
    static const char* const cPrivateCreators;

    // --- output --------------------------------------------------------------------------------

    /// Appends the text form to \p out at indentation \p level, under \p name (null: the bundle's
    /// own name).
    void print(ZmString& out, int level = 0, const char* name = nullptr) const;
    /// The FILE form (see the class comment), written with one fwrite.
    void print(FILE* file, int level = 0, const char* name = nullptr) const;

    // --- input ---------------------------------------------------------------------------------

    /// Reads the text form (either form `print` writes) of one bundle: on success this bundle
    /// takes its name and children (the old children are destroyed); on failure nothing changes
    /// and the result is `ZmResult::InvalidArgument` with the text "line L, column C: what was
    /// expected". The text form carries no types, so they are inferred: a quoted value is a
    /// text, a list of integers written as "%d" writes them is "int", a list that "%.8g" prints back
    /// as written is "float", any other list of numbers "double", an empty value an "int" of
    /// dimension 0. So print, parse and print again gives
    /// the same text, and parse, print and parse again gives an equal tree. A text printed with
    /// a space added after a final backslash reads back without the space. Nesting deeper than
    /// 1000 levels is refused.
    ZmResult parse(const char* text, uint64_t length);

private:
    static constexpr uint32_t kSortedBit = 0x80000000u;
    static constexpr uint32_t kCountMask = 0x7fffffffu;

    friend class HxParamBase;
    bool isSorted() const noexcept { return (m_bundleCount & kSortedBit) != 0; }
    void renameAliases(const char* rest);
    void adopt(HxParamBase* node) noexcept;
    void destroyChildren();
    void copyChildrenFrom(const HxParamBundle& other);
    void takeChildrenFrom(HxParamBundle& other) noexcept;
    void printInto(ZmString& out, int level, const char* name, bool toFile) const;
    HxParameter* findTagParameterInAll(const char* tag) const;
    HxParamBundle* privateCreators();
    bool resolvePrivateTag(const char* creator, const char* tag, bool reserve, char resolved[11]);
    bool resolvePrivateTag(const char* creator, const char* tag, char resolved[11]) const;

    ZmDArray<HxParamBase*> m_children;
    std::atomic<int32_t> m_sortLock{0};
    uint32_t m_bundleCount = 0;
};
