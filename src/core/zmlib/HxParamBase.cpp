#include <zmlib/HxParamBase.h>

#include <zmlib/HxParamBundle.h>
#include <zmlib/HxParamEditCheck.h>
#include <zmlib/ZmMemory.h>

#include <cstring>
#include <string>

namespace {

// The automatic names: "Bundle1", "Parameter1", ... (process-wide, unprotected, as documented).
int g_bundleNames = 0;
int g_parameterNames = 0;

char* duplicateText(const char* s)
{
    const size_t n = std::strlen(s) + 1;
    char* copy = static_cast<char*>(zmmalloc(n));
    std::memcpy(copy, s, n);
    return copy;
}

char sanitised(unsigned char c)
{
    if ((c >= '0' && c <= '9') || (c >= 'A' && c <= 'Z') || (c >= 'a' && c <= 'z') || c == '-') {
        return char(c);
    }
    switch (c) { // Latin-1 letters with a plain counterpart
    case 196:
        return 'A';
    case 214:
        return 'O';
    case 220:
        return 'U';
    case 223:
        return 's';
    case 228:
        return 'a';
    case 232:
    case 233:
    case 234:
        return 'e';
    case 246:
        return 'o';
    case 252:
        return 'u';
    default:
        return '_';
    }
}

char upper(char c)
{
    return c >= 'a' && c <= 'z' ? char(c - 'a' + 'A') : c;
}

} // namespace

HxParamBase::HxParamBase(Type type, const char* name) : m_type(type)
{
    if (type == PARAMETER) {
        setName(name);
    }
}

HxParamBase::HxParamBase(const HxParamBase& other)
    : m_type(other.m_type), m_touched(other.m_touched), m_flags(other.m_flags),
      m_name(duplicateText(other.m_name))
{}

HxParamBase& HxParamBase::operator=(const HxParamBase& other)
{
    if (this != &other) {
        m_touched = 0;
        m_flags = other.m_flags;
        setName(other.m_name);
    }
    return *this;
}

HxParamBase::~HxParamBase()
{
    zmfree(m_name);
}

void HxParamBase::setName(const char* name)
{
    if (name != nullptr && name == m_name) {
        return;
    }
    std::string text;
    if (name == nullptr || name[0] == 0) {
        text = (m_type == BUNDLE ? "Bundle" : "Parameter") +
               std::to_string(m_type == BUNDLE ? ++g_bundleNames : ++g_parameterNames);
    } else {
        text = name;
    }
    if (text[0] >= '0' && text[0] <= '9') {
        text.insert(text.begin(), '_');
    }
    std::string aliases;
    bool haveAliases = false;
    if (m_type == BUNDLE) {
        const size_t space = text.find(' ');
        if (space != std::string::npos) {
            aliases = text.substr(space + 1);
            haveAliases = true;
            text.resize(space);
        }
    }
    for (char& c : text) {
        c = sanitised(static_cast<unsigned char>(c));
    }
    const bool renamed = m_name != nullptr && text != m_name;
    char* fresh = duplicateText(text.c_str());
    zmfree(m_name);
    m_name = fresh;
    if (m_type == BUNDLE) {
        auto* self = static_cast<HxParamBundle*>(this);
        if (haveAliases) {
            self->set("Name", aliases.c_str());
        }
        self->renameAliases(m_name);
    }
    if (renamed) {
        m_touched |= 0x11;
        if (m_parent != nullptr) {
            m_parent->touch(0x04);
        }
    }
}

void HxParamBase::setFlag(int mask, int on) noexcept
{
    m_flags = uint16_t(on != 0 ? (m_flags | mask) : (m_flags & ~mask));
}

void HxParamBase::touch(int mask) noexcept
{
    HxParamBase* node = this;
    while (node != nullptr && mask != 0) {
        node->m_touched = uint8_t(node->m_touched | mask | 0x10);
        // A change of a node is a change below its parent.
        mask = (mask & ~0x03) | ((mask & 0x01) != 0 ? 0x04 : 0) | ((mask & 0x02) != 0 ? 0x08 : 0);
        node = node->m_parent;
    }
}

HxParamEditCheck* HxParamBase::editCheck() const
{
    for (const HxParamBase* node = this; node != nullptr; node = node->m_parent) {
        if (node->m_editCheck != nullptr) {
            return node->m_editCheck;
        }
    }
    return HxParamEditCheck::defaultEditCheck();
}

int HxParamBase::compareNames(const char* name, const char* key) noexcept
{
    if (name == nullptr || key == nullptr) {
        return name == key ? 0 : name == nullptr ? -1 : 1;
    }
    for (;; ++name, ++key) {
        const char k = *key == ' ' ? char(0) : upper(*key);
        const char n = upper(*name);
        if (n != k) {
            return static_cast<unsigned char>(n) < static_cast<unsigned char>(k) ? -1 : 1;
        }
        if (n == 0) {
            return 0;
        }
    }
}
