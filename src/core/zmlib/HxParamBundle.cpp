#include <zmlib/HxParamBundle.h>

#include <zmlib/ZmString.h>

#include <algorithm>
#include <cctype>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <string>
#include <type_traits>
#include <vector>

const char* const HxParamBundle::cPrivateCreators = "PrivateCreators";

namespace {

// Parameters printed to a FILE stream: while non-zero, transient children are left out and the
// comma rule applies (process-wide and unprotected, as documented).
int g_fileOutput = 0;

// A key beginning with a digit is looked up as "_" + key, as setName stores such names.
std::string lookupKey(const char* name)
{
    std::string key = name != nullptr ? name : "";
    if (!key.empty() && key[0] >= '0' && key[0] <= '9') {
        key.insert(key.begin(), '_');
    }
    return key;
}

bool sameName(const char* name, const std::string& key)
{
    return HxParamBase::compareNames(name, key.c_str()) == 0;
}

bool isBlank(char c)
{
    return c == ' ' || c == '\t' || c == '\n' || c == '\r' || c == '\f' || c == '\v';
}

// Splits \p text at white space into at most \p limit words.
std::vector<std::string> wordsOf(const char* text, size_t limit)
{
    std::vector<std::string> words;
    const char* p = text != nullptr ? text : "";
    while (*p != 0 && words.size() < limit) {
        while (isBlank(*p)) {
            ++p;
        }
        const char* start = p;
        while (*p != 0 && !isBlank(*p)) {
            ++p;
        }
        if (p > start) {
            words.emplace_back(start, size_t(p - start));
        }
    }
    return words;
}

// The n numbers of a text: for integers the decimal integer at the current place, after which the
// digits and '-' signs are skipped and then any spaces; an exhausted text gives 0.
template <class T>
void parseNumbers(const char* text, int n, T* out)
{
    const char* p = text;
    for (int i = 0; i < n; ++i) {
        if (*p == 0) {
            out[i] = T(0);
            continue;
        }
        if constexpr (std::is_integral_v<T>) {
            out[i] = T(std::atoi(p));
            while ((*p >= '0' && *p <= '9') || *p == '-') {
                ++p;
            }
        } else {
            char* end = nullptr;
            out[i] = T(std::strtod(p, &end));
            // A place that holds no number is passed over by one character, so the walk ends.
            p = end != p ? end : p + 1;
        }
        while (*p == ' ') {
            ++p;
        }
    }
}

// The value of a hex digit, -1 for anything else.
int hexDigit(char c)
{
    const int u = std::toupper(static_cast<unsigned char>(c));
    return u >= '0' && u <= '9' ? u - '0' : u >= 'A' && u <= 'F' ? u - 'A' + 10 : -1;
}

bool isCreatorName(const char* name)
{
    if (std::strlen(name) != 10 || name[6] != '0' || name[7] != '0') {
        return false;
    }
    const int d = hexDigit(name[4]);
    return d >= 0 && (d & 1) != 0; // private groups are odd
}

struct ColorName {
    const char* name;
    float rgb[3];
};

const ColorName kColors[] = {
    {"black", {0, 0, 0}},         {"white", {1, 1, 1}},        {"red", {1, 0, 0}},
    {"green", {0, 1, 0}},         {"blue", {0, 0, 1}},         {"yellow", {1, 1, 0}},
    {"cyan", {0, 1, 1}},          {"magenta", {1, 0, 1}},      {"gray", {0.5f, 0.5f, 0.5f}},
    {"grey", {0.5f, 0.5f, 0.5f}}, {"orange", {1, 0.5f, 0}},    {"brown", {0.6f, 0.3f, 0.1f}},
    {"pink", {1, 0.75f, 0.8f}},   {"purple", {0.5f, 0, 0.5f}},
};

// A colour from text: three numbers, "#RRGGBB" or a name.
bool parseColor(const char* text, float rgb[3])
{
    while (isBlank(*text)) {
        ++text;
    }
    if (text[0] == '#' && std::strlen(text) >= 7) {
        float c[3];
        for (int i = 0; i < 3; ++i) {
            const char pair[3] = {text[1 + 2 * i], text[2 + 2 * i], 0};
            char* end = nullptr;
            const long v = std::strtol(pair, &end, 16);
            if (end != pair + 2) {
                return false;
            }
            c[i] = float(v) / 255.0f;
        }
        std::copy(c, c + 3, rgb);
        return true;
    }
    for (const ColorName& c : kColors) {
        if (ZmString::strcasecmp(text, c.name) == 0) {
            std::copy(c.rgb, c.rgb + 3, rgb);
            return true;
        }
    }
    float c[3];
    const char* p = text;
    for (float& v : c) {
        char* end = nullptr;
        v = std::strtof(p, &end);
        if (end == p) {
            return false;
        }
        p = end;
        while (isBlank(*p) || *p == ',') {
            ++p;
        }
    }
    std::copy(c, c + 3, rgb);
    return true;
}

} // namespace

// --- construction ----------------------------------------------------------------------------------

HxParamBundle::HxParamBundle(const char* name) : HxParamBase(BUNDLE, nullptr)
{
    setName(name);
}

HxParamBundle::HxParamBundle(const HxParamBundle& other) : HxParamBase(other)
{
    try {
        copyChildrenFrom(other);
    } catch (...) {
        // The destructor does not run for a constructor that throws: free what was copied.
        destroyChildren();
        throw;
    }
}

// NOLINTNEXTLINE(performance-noexcept-move-constructor): the name is copied, which allocates
HxParamBundle::HxParamBundle(HxParamBundle&& other) : HxParamBase(other)
{
    takeChildrenFrom(other);
}

HxParamBundle& HxParamBundle::operator=(const HxParamBundle& other)
{
    if (this != &other) {
        HxParamBase::operator=(other);
        destroyChildren();
        copyChildrenFrom(other);
    }
    return *this;
}

// NOLINTNEXTLINE(performance-noexcept-move-constructor): renaming allocates
HxParamBundle& HxParamBundle::operator=(HxParamBundle&& other)
{
    if (this != &other) {
        HxParamBase::operator=(other);
        destroyChildren();
        takeChildrenFrom(other);
    }
    return *this;
}

HxParamBundle::~HxParamBundle()
{
    destroyChildren();
}

HxParamBundle* HxParamBundle::create(const char* name)
{
    return new HxParamBundle(name);
}

HxParamBase* HxParamBundle::duplicate() const
{
    return new HxParamBundle(*this);
}

void HxParamBundle::copyChildrenFrom(const HxParamBundle& other)
{
    // Child by child, so that a failed copy leaves a valid (partial) bundle behind.
    m_children.remax(other.m_children.size(), 0);
    for (const HxParamBase* child : other.m_children) {
        HxParamBase* copy = child->duplicate();
        try {
            m_children.append(copy);
        } catch (...) {
            delete copy;
            throw;
        }
        copy->m_parent = this;
        if (copy->isBundle()) {
            ++m_bundleCount;
        }
    }
    m_bundleCount |= other.m_bundleCount & kSortedBit;
}

void HxParamBundle::takeChildrenFrom(HxParamBundle& other) noexcept
{
    m_children.swapWith(other.m_children);
    std::swap(m_bundleCount, other.m_bundleCount);
    for (HxParamBase* child : m_children) {
        child->m_parent = this;
    }
}

void HxParamBundle::destroyChildren()
{
    for (HxParamBase* child : m_children) {
        delete child;
    }
    m_children.clear();
    m_bundleCount = 0;
}

void HxParamBundle::adopt(HxParamBase* node) noexcept
{
    node->m_parent = this;
}

// Step 6 of setName: the alias words of "Name" without the bundle's own name.
void HxParamBundle::renameAliases(const char* newName)
{
    HxParameter* aliases = find("Name", 0, 0x40);
    if (aliases == nullptr || aliases->primType() != ZmPrimType::STRING) {
        return;
    }
    std::string kept;
    for (const std::string& word : wordsOf(aliases->getString(), size_t(-1))) {
        if (word != newName) {
            kept += (kept.empty() ? "" : " ") + word;
        }
    }
    if (kept.empty()) {
        remove(aliases);
    } else {
        aliases->set(kept.c_str());
    }
}

// --- children --------------------------------------------------------------------------------------

HxParamBundle* HxParamBundle::bundle(int i) const noexcept
{
    return i >= 0 && i < nBundles() ? static_cast<HxParamBundle*>(m_children[i]) : nullptr;
}

int HxParamBundle::index(const HxParamBase* node) const noexcept
{
    if (node == nullptr || node->m_parent != this) {
        return -1;
    }
    if (node->isBundle()) {
        for (int i = 0; i < nBundles(); ++i) {
            if (m_children[i] == node) {
                return i;
            }
        }
    } else {
        for (int i = size() - 1; i >= nBundles(); --i) {
            if (m_children[i] == node) {
                return i;
            }
        }
    }
    return -1;
}

void HxParamBundle::insert(HxParamBase* node, int replace)
{
    if (node == nullptr) {
        return;
    }
    if (node->isBundle()) {
        // The two names point at each other on purpose.
        auto* b = static_cast<HxParamBundle*>(node);
        if (std::strcmp(node->name(), "BoundaryIds") == 0) {
            b->set("name", "BoundaryConditions");
        } else if (std::strcmp(node->name(), "BoundaryConditions") == 0) {
            b->set("name", "BoundaryIds");
        }
    }
    const bool isBundle = node->isBundle();
    const int first = isBundle ? 0 : nBundles();
    const int last = isBundle ? nBundles() : size();
    if (replace != 0) {
        for (int i = first; i < last; ++i) {
            HxParamBase* old = m_children[i];
            if (old != node && compareNames(old->name(), node->name()) == 0) {
                node->m_flags = uint16_t(node->m_flags | old->m_flags);
                m_children[i] = node;
                adopt(node);
                delete old;
                // The replacement may sort elsewhere.
                m_bundleCount &= ~kSortedBit;
                touch(0x02);
                return;
            }
        }
    }
    try {
        if (isBundle) {
            m_children.insert(nBundles(), node);
        } else {
            m_children.append(node);
        }
    } catch (...) {
        delete node; // the bundle owns what it was given, also when it cannot keep it
        throw;
    }
    if (isBundle) {
        m_bundleCount = (m_bundleCount & kSortedBit) | ((m_bundleCount & kCountMask) + 1);
    }
    m_bundleCount &= ~kSortedBit;
    adopt(node);
    touch(0x02);
}

void HxParamBundle::remove(HxParamBase* node)
{
    const int i = index(node);
    if (i < 0 || node->flag(NO_DELETE) != 0) {
        return;
    }
    m_children.remove(i, 1);
    if (node->isBundle()) {
        m_bundleCount = (m_bundleCount & kSortedBit) | ((m_bundleCount & kCountMask) - 1);
    }
    delete node;
    touch(0x02);
}

void HxParamBundle::remove(const char* name)
{
    remove(findBase(name));
}

void HxParamBundle::removeAll()
{
    destroyChildren();
}

void HxParamBundle::move(HxParamBundle& source)
{
    if (&source == this) {
        return;
    }
    if (size() == 0) {
        // Each side keeps its own sorted state.
        const uint32_t mine = m_bundleCount & kSortedBit;
        const uint32_t theirs = source.m_bundleCount & kSortedBit;
        m_children.swapWith(source.m_children);
        const uint32_t count = source.m_bundleCount & kCountMask;
        source.m_bundleCount = theirs | (m_bundleCount & kCountMask);
        m_bundleCount = mine | count;
        for (HxParamBase* child : m_children) {
            adopt(child);
        }
        return;
    }
    ZmDArray<HxParamBase*> moved;
    moved.swapWith(source.m_children);
    source.m_bundleCount &= kSortedBit;
    for (HxParamBase* child : moved) {
        insert(child, 1);
    }
}

void HxParamBundle::copy(const HxParamBase& source)
{
    // A bundle copied into itself would grow the array it walks; the result would equal it anyway.
    if (source.flag(NO_COPY) != 0 || &source == this) {
        return;
    }
    if (!source.isBundle()) {
        insert(source.duplicate(), 1);
        return;
    }
    const auto& from = static_cast<const HxParamBundle&>(source);
    const bool wasEmpty = size() == 0;
    for (const HxParamBase* child : from.m_children) {
        if (child->flag(NO_COPY) != 0) {
            continue;
        }
        if (wasEmpty) {
            insert(child->duplicate(), 0);
            continue;
        }
        if (child->isBundle()) {
            if (HxParamBundle* mine = bundle(child->name())) {
                mine->copy(*child);
                continue;
            }
        }
        insert(child->duplicate(), 1);
    }
}

void HxParamBundle::copyAll(const HxParamBase& source)
{
    if (&source == this) {
        return;
    }
    if (!source.isBundle()) {
        HxParamBase* copy = source.duplicate();
        copy->setEditCheck(source.m_editCheck);
        insert(copy, 1);
        return;
    }
    const auto& from = static_cast<const HxParamBundle&>(source);
    for (const HxParamBase* child : from.m_children) {
        if (child->isBundle()) {
            if (HxParamBundle* mine = bundle(child->name())) {
                mine->copyAll(*child);
                continue;
            }
        }
        HxParamBase* copy = child->duplicate();
        copy->setEditCheck(child->m_editCheck);
        insert(copy, 1);
    }
}

void HxParamBundle::sortParameters()
{
    while (m_sortLock.exchange(1, std::memory_order_acquire) != 0) {
    }
    if (!isSorted()) {
        std::sort(m_children.begin() + nBundles(), m_children.end(),
                  [](const HxParamBase* a, const HxParamBase* b) {
                      return compareNames(a->name(), b->name()) < 0;
                  });
        m_bundleCount |= kSortedBit;
    }
    m_sortLock.store(0, std::memory_order_release);
}

void HxParamBundle::untouchAll(int mask)
{
    untouch(mask);
    for (HxParamBase* child : m_children) {
        if (child->isBundle()) {
            static_cast<HxParamBundle*>(child)->untouchAll(mask);
        } else {
            child->untouch(mask);
        }
    }
}

// --- lookup ----------------------------------------------------------------------------------------

namespace {

// Whether a find mask accepts a parameter type (the receiving capacities).
bool accepts(int typeMask, int type)
{
    int needed = 0;
    switch (type) {
    case ZmPrimType::BYTE:
        needed = 0x01 | 0x02 | 0x04 | 0x08 | 0x10 | 0x40;
        break;
    case ZmPrimType::SHORT:
    case ZmPrimType::USHORT:
        needed = 0x02 | 0x04 | 0x08 | 0x10 | 0x40;
        break;
    case ZmPrimType::INT:
        needed = 0x04 | 0x08 | 0x10 | 0x40;
        break;
    case ZmPrimType::FLOAT:
        needed = 0x08 | 0x10 | 0x40;
        break;
    case ZmPrimType::DOUBLE:
        needed = 0x10 | 0x40;
        break;
    case ZmPrimType::STRING:
        needed = 0x40;
        break;
    default: // complex, uint and sbyte are never found, as they never were
        return false;
    }
    return (typeMask & needed) != 0;
}

} // namespace

HxParameter* HxParamBundle::find(const char* name, int dim, int typeMask) const
{
    const std::string key = lookupKey(name);
    auto suitable = [&](const HxParamBase* node) {
        const auto* p = static_cast<const HxParameter*>(node);
        return (dim < 1 || p->dim() == dim) && accepts(typeMask, p->primType());
    };
    if (isSorted()) {
        HxParamBase* const* lo = m_children.begin() + nBundles();
        HxParamBase* const* hi = m_children.end();
        HxParamBase* const* at =
            std::lower_bound(lo, hi, key, [](const HxParamBase* n, const std::string& k) {
                return compareNames(n->name(), k.c_str()) < 0;
            });
        for (; at != hi && sameName((*at)->name(), key); ++at) {
            if (suitable(*at)) {
                return static_cast<HxParameter*>(*at);
            }
        }
        return nullptr;
    }
    for (int i = nBundles(); i < size(); ++i) {
        if (sameName(m_children[i]->name(), key) && suitable(m_children[i])) {
            return static_cast<HxParameter*>(m_children[i]);
        }
    }
    return nullptr;
}

HxParamBase* HxParamBundle::findBase(const char* name) const
{
    const std::string key = lookupKey(name);
    for (int i = 0; i < nBundles(); ++i) {
        if (sameName(m_children[i]->name(), key)) {
            return m_children[i];
        }
    }
    return find(name, 0, 255);
}

HxParameter* HxParamBundle::findSorted(const char* name)
{
    if (!isSorted()) {
        sortParameters();
    }
    return find(name, 0, 255);
}

HxParameter* HxParamBundle::findRecursive(const char* name) const
{
    if (HxParameter* p = find(name, 0, 255)) {
        return p;
    }
    for (int i = 0; i < nBundles(); ++i) {
        if (HxParameter* p = static_cast<const HxParamBundle*>(m_children[i])->findRecursive(name)) {
            return p;
        }
    }
    return nullptr;
}

HxParamBundle* HxParamBundle::bundle(const char* name) const
{
    const std::string key = lookupKey(name);
    for (int i = 0; i < nBundles(); ++i) {
        if (sameName(m_children[i]->name(), key)) {
            return static_cast<HxParamBundle*>(m_children[i]);
        }
    }
    for (int i = 0; i < nBundles(); ++i) {
        const HxParameter* aliases = static_cast<HxParamBundle*>(m_children[i])->find("Name", 0, 0x40);
        if (aliases == nullptr || aliases->primType() != ZmPrimType::STRING) {
            continue;
        }
        for (const std::string& word : wordsOf(aliases->getString(), 16)) {
            if (compareNames(word.c_str(), key.c_str()) == 0) {
                return static_cast<HxParamBundle*>(m_children[i]);
            }
        }
    }
    return nullptr;
}

HxParamBundle* HxParamBundle::bundle(const char* name, int create)
{
    HxParamBundle* found = static_cast<const HxParamBundle*>(this)->bundle(name);
    if (found == nullptr && create != 0) {
        found = new HxParamBundle(name);
        insert(found, 1);
    }
    return found;
}

// --- typed shortcuts -------------------------------------------------------------------------------

namespace {

template <class T, class Get>
int fillFrom(const HxParameter* p, int n, T* out, Get get)
{
    if (p == nullptr || n < 0) {
        return 0;
    }
    if (p->primType() == ZmPrimType::STRING) {
        parseNumbers(static_cast<const char*>(p->dataPtr()), n, out);
        return 1;
    }
    if (p->dim() != n) {
        return 0;
    }
    for (int i = 0; i < n; ++i) {
        out[i] = T(get(p, i));
    }
    return 1;
}

int numOf(const HxParameter* p, int i)
{
    return p->getNum(i);
}

double realOf(const HxParameter* p, int i)
{
    return p->getReal(i);
}

} // namespace

int HxParamBundle::findNum(const char* name, int& value) const
{
    return findNum(name, 1, &value);
}

int HxParamBundle::findNum(const char* name, int n, int* values) const
{
    return fillFrom(find(name, 0, 255), n, values, numOf);
}

int HxParamBundle::findReal(const char* name, float& value) const
{
    return findReal(name, 1, &value);
}

int HxParamBundle::findReal(const char* name, double& value) const
{
    return findReal(name, 1, &value);
}

int HxParamBundle::findReal(const char* name, int n, float* values) const
{
    return fillFrom(find(name, 0, 255), n, values, realOf);
}

int HxParamBundle::findReal(const char* name, int n, double* values) const
{
    return fillFrom(find(name, 0, 255), n, values, realOf);
}

int HxParamBundle::findString(const char* name, const char*& value) const
{
    const HxParameter* p = find(name, 0, 255);
    if (p == nullptr) {
        return 0;
    }
    value = p->getString();
    return 1;
}

int HxParamBundle::findColor(const char* name, float color[3]) const
{
    const HxParameter* p = find(name, 0, 255);
    if (p == nullptr) {
        return 0;
    }
    if (p->primType() == ZmPrimType::STRING) {
        return parseColor(static_cast<const char*>(p->dataPtr()), color) ? 1 : 0;
    }
    if (p->dim() != 3) {
        return 0;
    }
    for (int i = 0; i < 3; ++i) {
        color[i] = float(p->getReal(i));
    }
    return 1;
}

int HxParamBundle::findColor(float color[3]) const
{
    return findColor("Color", color);
}

void HxParamBundle::setColor(const float color[3])
{
    set("Color", 3, color);
}

// --- setting by name -------------------------------------------------------------------------------

namespace {

template <class... Args>
void setParameter(HxParamBundle& b, const char* name, Args... args)
{
    if (HxParameter* p = b.find(name, 0, 255)) {
        p->set(args...);
    } else {
        b.insert(new HxParameter(name, args...), 1);
    }
}

} // namespace

void HxParamBundle::set(const char* name, const char* text)
{
    setParameter(*this, name, text != nullptr ? text : "");
}

void HxParamBundle::set(const char* name, int value)
{
    setParameter(*this, name, value);
}

void HxParamBundle::set(const char* name, double value)
{
    setParameter(*this, name, value);
}

void HxParamBundle::set(const char* name, int n, const int* values)
{
    setParameter(*this, name, n, values);
}

void HxParamBundle::set(const char* name, int n, const float* values)
{
    setParameter(*this, name, n, values);
}

void HxParamBundle::set(const char* name, int n, const double* values)
{
    setParameter(*this, name, n, values);
}

void HxParamBundle::setAsString(const char* name, int n, const int* values)
{
    std::string text;
    for (int i = 0; i < n; ++i) {
        text += (i > 0 ? " " : "") + std::to_string(values[i]);
    }
    set(name, text.c_str());
}

// --- well-known sub-bundles ------------------------------------------------------------------------

HxParamBundle* HxParamBundle::boundaryIds(int create)
{
    return bundle("BoundaryIds", create);
}

HxParamBundle* HxParamBundle::materials(int create)
{
    return bundle("Materials", create);
}

HxParamBundle* HxParamBundle::dicomAll() const
{
    const HxParamBundle* dicom = bundle("DICOM");
    return dicom != nullptr ? dicom->bundle("All") : nullptr;
}

HxParamBundle* HxParamBundle::dicomAllCreate()
{
    return bundle("DICOM", 1)->bundle("All", 1);
}

// --- DICOM -----------------------------------------------------------------------------------------

namespace {

// The value of a DICOM parameter, or null.
const char* tagValue(const HxParameter* p)
{
    const char* value = nullptr;
    return p != nullptr && p->getBundleTagValue(value) != 0 ? value : nullptr;
}

bool numbersOf(const char* text, ZmDArray<float>& values)
{
    if (text == nullptr) {
        return false;
    }
    ZmDArray<float> parsed;
    const char* p = text;
    for (;;) {
        char* end = nullptr;
        const float v = std::strtof(p, &end);
        if (end == p) {
            return false;
        }
        parsed.append(v);
        p = end;
        while (isBlank(*p)) {
            ++p;
        }
        if (*p == 0) {
            break;
        }
        if (*p != '\\') {
            return false;
        }
        ++p;
    }
    values = parsed;
    return true;
}

} // namespace

const char* HxParamBundle::findTag(const char* tag, const char* dflt) const
{
    const HxParamBundle* all = dicomAll();
    return all != nullptr ? all->findTagInAll(tag, dflt) : dflt;
}

int HxParamBundle::findTag(const char* tag, float& value) const
{
    const HxParamBundle* all = dicomAll();
    return all != nullptr ? all->findTagInAll(tag, value) : 0;
}

int HxParamBundle::findTag(const char* tag, ZmDArray<float>& values) const
{
    const HxParamBundle* all = dicomAll();
    return all != nullptr ? all->findTagInAll(tag, values) : 0;
}

HxParameter* HxParamBundle::findTagParameterInAll(const char* tag) const
{
    if (bundle("G5200-9230") == nullptr) {
        return find(tag, 0, 0x40);
    }
    ZmString mapped;
    const char* key = replaceTag(ZmString(tag != nullptr ? tag : ""), mapped) ? mapped.getString() : tag;
    for (const char* groups : {"G5200-9230", "G5200-9229"}) {
        if (const HxParamBundle* g = bundle(groups)) {
            if (HxParameter* p = g->findRecursive(key)) {
                return p;
            }
        }
    }
    return nullptr;
}

const char* HxParamBundle::findTagInAll(const char* tag, const char* dflt) const
{
    const char* value = tagValue(findTagParameterInAll(tag));
    return value != nullptr ? value : dflt;
}

int HxParamBundle::findTagInAll(const char* tag, float& value) const
{
    ZmDArray<float> values;
    if (!findTagInAll(tag, values) || values.size() < 1) {
        return 0;
    }
    value = values[0];
    return 1;
}

int HxParamBundle::findTagInAll(const char* tag, ZmDArray<float>& values) const
{
    return numbersOf(tagValue(findTagParameterInAll(tag)), values) ? 1 : 0;
}

int HxParamBundle::findTagInAll(const char* tag, int& value) const
{
    const char* text = tagValue(findTagParameterInAll(tag));
    if (text == nullptr) {
        return 0;
    }
    char* end = nullptr;
    const long v = std::strtol(text, &end, 10);
    if (end == text) {
        return 0;
    }
    value = int(v);
    return 1;
}

const char* HxParamBundle::findTagInEnhancedDicomBundle(const char* tag, const char* dflt) const
{
    if (bundle("G5200-9230") == nullptr) {
        return dflt;
    }
    return findTagInAll(tag, dflt);
}

void HxParamBundle::setTag(const char* tag, const char* value)
{
    const std::string text = std::string(": ") + (value != nullptr ? value : "");
    dicomAllCreate()->set(tag, text.c_str());
}

bool HxParamBundle::replaceTag(const ZmString& in, ZmString& out)
{
    struct Pair {
        unsigned group, element, newGroup, newElement;
    };
    static const Pair kTable[] = {{0x0018, 0x0081, 0x0018, 0x9082}, {0x0008, 0x0008, 0x0008, 0x9007},
                                  {0x0020, 0x0060, 0x0020, 0x9072}, {0x0008, 0x002A, 0x0018, 0x9074},
                                  {0x0020, 0x0100, 0x0020, 0x9128}, {0x0018, 0x1060, 0x0020, 0x9153}};
    if (in.length() < 10) {
        return false;
    }
    auto hex = [&](int from, unsigned& v) {
        v = 0;
        for (int i = from; i < from + 4; ++i) {
            const int d = hexDigit(in.getString()[i]);
            if (d < 0) {
                return false;
            }
            v = v * 16 + unsigned(d);
        }
        return true;
    };
    unsigned group = 0;
    unsigned element = 0;
    if (!hex(1, group) || !hex(6, element)) {
        return false;
    }
    for (const Pair& p : kTable) {
        if (p.group == group && p.element == element) {
            out = ZmString(0, "G%04X-%04X", p.newGroup, p.newElement);
            return true;
        }
    }
    return false;
}

bool HxParamBundle::isEnhancedDcm(const HxParamBundle** perFrame, const HxParamBundle** shared) const
{
    if (perFrame != nullptr) {
        *perFrame = nullptr;
    }
    if (shared != nullptr) {
        *shared = nullptr;
    }
    const HxParamBundle* frames = bundle("G5200-9230");
    if (frames == nullptr) {
        return false;
    }
    if (perFrame != nullptr) {
        *perFrame = frames;
    }
    if (shared != nullptr) {
        *shared = bundle("G5200-9229");
    }
    return true;
}

// --- private tags ----------------------------------------------------------------------------------

HxParamBundle* HxParamBundle::privateCreators()
{
    if (HxParamBundle* known = bundle(cPrivateCreators)) {
        return known;
    }
    auto* creators = new HxParamBundle(cPrivateCreators);
    creators->setFlag(TRANSIENT, 1);
    for (int i = nBundles(); i < size(); ++i) {
        const auto* p = static_cast<const HxParameter*>(m_children[i]);
        const char* value = tagValue(p);
        if (value != nullptr && isCreatorName(p->name())) {
            creators->insert(new HxParameter(p->name(), value), 0);
        }
    }
    insert(creators, 1);
    return creators;
}

bool HxParamBundle::resolvePrivateTag(const char* creator, const char* tag, char resolved[11]) const
{
    const HxParamBundle* creators = bundle(cPrivateCreators);
    if (creator == nullptr || tag == nullptr || std::strlen(tag) != 10) {
        return false;
    }
    std::string name;
    if (creators == nullptr) {
        // Not built yet: the creators are read from this bundle directly.
        for (int i = nBundles(); i < size() && name.empty(); ++i) {
            const auto* p = static_cast<const HxParameter*>(m_children[i]);
            const char* value = tagValue(p);
            if (value != nullptr && isCreatorName(p->name()) && std::strncmp(p->name(), tag, 5) == 0 &&
                std::strcmp(value, creator) == 0) {
                name = p->name();
            }
        }
    } else {
        for (int i = creators->nBundles(); i < creators->size() && name.empty(); ++i) {
            const auto* p = static_cast<const HxParameter*>(creators->m_children[i]);
            if (std::strncmp(p->name(), tag, 5) == 0 && p->primType() == ZmPrimType::STRING &&
                std::strcmp(static_cast<const char*>(p->dataPtr()), creator) == 0) {
                name = p->name();
            }
        }
    }
    if (name.empty()) {
        return false;
    }
    std::memcpy(resolved, tag, 11);
    resolved[6] = name[8];
    resolved[7] = name[9];
    return true;
}

bool HxParamBundle::resolvePrivateTag(const char* creator, const char* tag, bool reserve, char resolved[11])
{
    if (creator == nullptr || tag == nullptr || std::strlen(tag) != 10) {
        return false;
    }
    HxParamBundle* creators = privateCreators(); // built on first need
    if (static_cast<const HxParamBundle*>(this)->resolvePrivateTag(creator, tag, resolved)) {
        return true;
    }
    if (!reserve) {
        return false;
    }
    // The lowest block from 0x10 whose creator name is free. Each digit is added to '0', as
    // blocks have always been written, so 10 to 15 give ':' to '?', which the name rules then
    // turn into '_': such names are compared as stored, so one of them is never given twice.
    std::string name;
    for (int block = 0x10; block <= 0xff && name.empty(); ++block) {
        const char written[11] = {tag[0],
                                  tag[1],
                                  tag[2],
                                  tag[3],
                                  tag[4],
                                  tag[5],
                                  '0',
                                  '0',
                                  char('0' + block / 16),
                                  char('0' + block % 16),
                                  0};
        const HxParameter stored(written, 0); // the name as the tree stores it
        if (creators->find(stored.name(), 0, 255) == nullptr && find(stored.name(), 0, 255) == nullptr) {
            name = stored.name();
        }
    }
    if (name.empty()) {
        return false;
    }
    creators->insert(new HxParameter(name.c_str(), creator), 1);
    set(name.c_str(), (std::string("PrivateCreator: ") + creator).c_str());
    std::memcpy(resolved, tag, 11);
    resolved[6] = name[8];
    resolved[7] = name[9];
    return true;
}

const char* HxParamBundle::findPrivateTag(const char* creator, const char* tag, const char* dflt)
{
    HxParamBundle* all = dicomAll();
    return all != nullptr ? all->findPrivateTagInAll(creator, tag, dflt) : dflt;
}

const char* HxParamBundle::findPrivateTagInAll(const char* creator, const char* tag, const char* dflt)
{
    char resolved[11] = {};
    if (!resolvePrivateTag(creator, tag, false, resolved)) {
        return dflt;
    }
    const char* value = tagValue(find(resolved, 0, 0x40));
    return value != nullptr ? value : dflt;
}

void HxParamBundle::setPrivateTagInAll(const char* creator, const char* tag, const char* value)
{
    char resolved[11] = {};
    if (creator == nullptr || tag == nullptr ||
        !resolvePrivateTag(creator, tag, value != nullptr, resolved)) {
        return;
    }
    if (value != nullptr) {
        set(resolved, (std::string(": ") + value).c_str());
    } else {
        remove(find(resolved, 0, 255));
    }
}

HxParamBundle* HxParamBundle::privateSequenceItemInAll(const char* creator, const char* tag, int item) const
{
    char resolved[11] = {};
    if (!resolvePrivateTag(creator, tag, resolved)) {
        return nullptr;
    }
    const HxParamBundle* sequence = bundle(resolved);
    return sequence != nullptr ? sequence->bundle(ZmString(0, "Item_%d", item).getString()) : nullptr;
}

HxParamBundle* HxParamBundle::privateSequenceItemInAll(const char* creator, const char* tag,
                                                       const char* description, int item, bool create)
{
    if (!create) {
        return static_cast<const HxParamBundle*>(this)->privateSequenceItemInAll(creator, tag, item);
    }
    char resolved[11] = {};
    if (!resolvePrivateTag(creator, tag, true, resolved)) {
        return nullptr;
    }
    HxParamBundle* sequence = bundle(resolved, 1);
    if (description != nullptr && sequence->find("Description", 0, 255) == nullptr) {
        sequence->set("Description", description);
    }
    const ZmString itemName(0, "Item_%d", item);
    HxParamBundle* found = sequence->bundle(itemName.getString());
    if (found == nullptr) {
        found = sequence->bundle(itemName.getString(), 1);
        found->set("Description", ZmString(0, "Item %d", item).getString());
    }
    return found;
}

// --- output ----------------------------------------------------------------------------------------

void HxParamBundle::print(ZmString& out, int level, const char* name) const
{
    printInto(out, level, name, g_fileOutput != 0);
}

void HxParamBundle::print(FILE* file, int level, const char* name) const
{
    ++g_fileOutput;
    ZmString text;
    print(text, level, name);
    --g_fileOutput;
    if (file != nullptr && text.length() > 0) {
        std::fwrite(text.getString(), 1, size_t(text.length()), file);
    }
}

void HxParamBundle::printInto(ZmString& out, int level, const char* name, bool toFile) const
{
    const std::string indent(size_t(level > 0 ? level : 0) * 4, ' ');
    out += indent.c_str();
    out += name != nullptr ? name : this->name();
    out += " {\n";
    // The comma rule: only while a file is written, a parameter is followed by "," when a later
    // child is not transient (a bundle or a hidden child counts too).
    int lastKept = 0;
    if (toFile) {
        for (int i = size() - 1; i >= 0; --i) {
            if (m_children[i]->flag(TRANSIENT) == 0) {
                lastKept = i;
                break;
            }
        }
    }
    const std::string inner = indent + "    ";
    ZmString value;
    for (int i = 0; i < size(); ++i) {
        const HxParamBase* child = m_children[i];
        if (child->flag(HIDDEN) != 0 || (toFile && child->flag(TRANSIENT) != 0)) {
            continue;
        }
        if (child->isBundle()) {
            static_cast<const HxParamBundle*>(child)->printInto(out, level + 1, nullptr, toFile);
            continue;
        }
        const auto* p = static_cast<const HxParameter*>(child);
        out += inner.c_str();
        out += p->name();
        out += ' ';
        if (p->primType() == ZmPrimType::STRING) {
            const char* text = static_cast<const char*>(p->dataPtr());
            out += '"';
            for (const char* c = text; *c != 0; ++c) {
                if (*c == '"') {
                    out += '\\';
                }
                out += *c;
            }
            const size_t n = std::strlen(text);
            if (n > 0 && text[n - 1] == '\\') {
                out += ' ';
            }
            out += '"';
        } else {
            p->print(value, false);
            out += value;
        }
        if (i < lastKept) {
            out += ',';
        }
        out += '\n';
    }
    out += indent.c_str();
    out += "}\n";
}

// --- input -----------------------------------------------------------------------------------------

namespace {

// A reader of the text form over [p, end), tracking line and column for its messages.
class TextReader {
public:
    TextReader(const char* text, uint64_t length) : m_p(text), m_end(text + length) {}

    bool failed() const { return !m_error.empty(); }
    const std::string& error() const { return m_error; }

    // name " {" NL children "}" NL, into \p into (its name and children).
    void bundle(HxParamBundle& into, int depth)
    {
        skipBlanks();
        const std::string name = word();
        if (name.empty()) {
            return fail("a bundle name");
        }
        skipSpaces();
        if (!take('{') || !endOfLine()) {
            return fail("\"{\" and the end of the line after the bundle name");
        }
        into.setName(name.c_str());
        if (depth > kMaxDepth) {
            return fail("at most 1000 nested bundles");
        }
        for (;;) {
            skipBlanks();
            if (m_p == m_end) {
                return fail("\"}\" closing the bundle");
            }
            if (*m_p == '}') {
                ++m_p;
                ++m_column;
                if (!endOfLine()) {
                    return fail("the end of the line after \"}\"");
                }
                return;
            }
            child(into, depth);
            if (failed()) {
                return;
            }
        }
    }

    void skipBlanks()
    {
        while (m_p != m_end && (*m_p == ' ' || *m_p == '\t' || *m_p == '\r' || *m_p == '\n')) {
            advance();
        }
    }

    bool atEnd() const { return m_p == m_end; }

    void fail(const char* expected)
    {
        if (m_error.empty()) {
            m_error = "line " + std::to_string(m_line) + ", column " + std::to_string(m_column) +
                      ": expected " + expected;
        }
    }

private:
    static constexpr int kMaxDepth = 1000;

    void child(HxParamBundle& into, int depth)
    {
        const char* start = m_p;
        const int line = m_line;
        const int column = m_column;
        const std::string name = word();
        if (name.empty()) {
            return fail("a parameter or bundle name");
        }
        skipSpaces();
        if (m_p != m_end && *m_p == '{') {
            // A sub-bundle: read it again from its name.
            m_p = start;
            m_line = line;
            m_column = column;
            auto* sub = new HxParamBundle(nullptr);
            into.insert(sub, 0);
            return bundle(*sub, depth + 1);
        }
        if (m_p != m_end && *m_p == '"') {
            std::string text;
            if (!quoted(text)) {
                return;
            }
            into.insert(new HxParameter(name.c_str(), text.c_str()), 0);
        } else {
            const char* from = m_p;
            const int fromLine = m_line;
            const int fromColumn = m_column;
            while (m_p != m_end && *m_p != '\n' && *m_p != ',') {
                advance();
            }
            std::vector<double> values;
            ZmPrimType::Type type = ZmPrimType::INT;
            if (!numbers(std::string(from, size_t(m_p - from)), values, type)) {
                m_p = from;
                m_line = fromLine;
                m_column = fromColumn;
                return fail("numbers or a quoted text as the value");
            }
            const int n = int(values.size());
            if (type == ZmPrimType::INT) {
                const std::vector<int> ints(values.begin(), values.end());
                into.insert(new HxParameter(name.c_str(), n, ints.data()), 0);
            } else if (type == ZmPrimType::FLOAT) {
                const std::vector<float> floats(values.begin(), values.end());
                into.insert(new HxParameter(name.c_str(), n, floats.data()), 0);
            } else {
                into.insert(new HxParameter(name.c_str(), n, values.data()), 0);
            }
        }
        take(',');
        if (!endOfLine()) {
            fail("the end of the line after the value");
        }
    }

    // A quoted text: \" is a quote; a final backslash was printed with a space after it.
    bool quoted(std::string& text)
    {
        const char* open = m_p;
        const int openLine = m_line;
        const int openColumn = m_column;
        advance(); // the opening quote
        while (m_p != m_end) {
            const char c = *m_p;
            if (c == '"') {
                advance();
                if (text.size() >= 2 && text[text.size() - 1] == ' ' && text[text.size() - 2] == '\\') {
                    text.pop_back();
                }
                return true;
            }
            if (c == '\\' && m_p + 1 != m_end && m_p[1] == '"') {
                advance();
                advance();
                text += '"';
                continue;
            }
            text += c;
            advance();
        }
        m_p = open; // the message points at the quote that was never closed
        m_line = openLine;
        m_column = openColumn;
        fail("the closing quote of the text that starts here");
        return false;
    }

    // Whether [p, p + n) is an integer as "%d" writes it: digits without leading zeros, a '-'
    // before anything but 0.
    static bool isIntText(const char* p, size_t n)
    {
        const size_t sign = n > 0 && p[0] == '-' ? 1 : 0;
        if (n == sign || n - sign > 10 || (p[sign] == '0' && n - sign > 1) || (sign == 1 && p[1] == '0')) {
            return false;
        }
        for (size_t i = sign; i < n; ++i) {
            if (p[i] < '0' || p[i] > '9') {
                return false;
            }
        }
        return true;
    }

    // The digits of a number's mantissa after its leading zeros.
    static int significantDigits(const char* p, size_t n)
    {
        int digits = 0;
        bool leading = true;
        for (size_t i = 0; i < n && p[i] != 'e' && p[i] != 'E'; ++i) {
            if (p[i] >= '0' && p[i] <= '9') {
                leading = leading && p[i] == '0';
                digits += leading ? 0 : 1;
            }
        }
        return digits;
    }

    // The numbers of a value and the narrowest type that prints them back as written: "int"
    // for whole numbers in the int range, "float" when "%.8g" of each value as a float gives its
    // text again, "double" otherwise.
    static bool numbers(const std::string& field, std::vector<double>& values, ZmPrimType::Type& type)
    {
        const char* p = field.c_str();
        bool whole = true;
        bool asFloat = true;
        for (;;) {
            while (*p == ' ' || *p == '\t' || *p == '\r') {
                ++p;
            }
            if (*p == 0) {
                break;
            }
            char* end = nullptr;
            const double v = std::strtod(p, &end);
            if (end == p || (*end != 0 && *end != ' ' && *end != '\t' && *end != '\r')) {
                return false;
            }
            const size_t length = size_t(end - p);
            const bool isInt = isIntText(p, length) && v >= -2147483648.0 && v <= 2147483647.0;
            // "%.8g" writes at most 8 significant digits: only such tokens can be floats, and
            // only those are printed again to compare (printing is the slow part of reading).
            if (asFloat) {
                char again[32];
                asFloat = significantDigits(p, length) <= 8 &&
                          std::snprintf(again, sizeof again, "%.8g", double(float(v))) == int(length) &&
                          std::memcmp(again, p, length) == 0;
            }
            whole = whole && isInt;
            values.push_back(v);
            p = end;
        }
        type = whole ? ZmPrimType::INT : asFloat ? ZmPrimType::FLOAT : ZmPrimType::DOUBLE;
        return true;
    }

    std::string word()
    {
        const char* from = m_p;
        while (m_p != m_end && *m_p != ' ' && *m_p != '\t' && *m_p != '\n' && *m_p != '\r' && *m_p != '{' &&
               *m_p != '}' && *m_p != '"' && *m_p != ',') {
            advance();
        }
        return std::string(from, size_t(m_p - from));
    }

    void skipSpaces()
    {
        while (m_p != m_end && (*m_p == ' ' || *m_p == '\t' || *m_p == '\r')) {
            advance();
        }
    }

    bool take(char c)
    {
        if (m_p != m_end && *m_p == c) {
            advance();
            return true;
        }
        return false;
    }

    bool endOfLine()
    {
        skipSpaces();
        if (m_p == m_end) {
            return true;
        }
        if (*m_p == '\n') {
            advance();
            return true;
        }
        return false;
    }

    void advance()
    {
        if (*m_p == '\n') {
            ++m_line;
            m_column = 1;
        } else {
            ++m_column;
        }
        ++m_p;
    }

    const char* m_p;
    const char* m_end;
    int m_line = 1;
    int m_column = 1;
    std::string m_error;
};

} // namespace

ZmResult HxParamBundle::parse(const char* text, uint64_t length)
{
    HxParamBundle read(nullptr);
    TextReader reader(text != nullptr ? text : "", text != nullptr ? length : 0);
    reader.bundle(read, 0);
    if (!reader.failed()) {
        reader.skipBlanks();
        if (!reader.atEnd()) {
            reader.fail("the end of the text after the bundle");
        }
    }
    if (reader.failed()) {
        return ZmResult(ZmResult::InvalidArgument, reader.error().c_str(), nullptr);
    }
    setName(read.name());
    destroyChildren();
    takeChildrenFrom(read);
    return ZmResult();
}
