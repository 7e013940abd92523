#include "ID.h"

#include "WideString.h"

namespace
{
const ACE_WString::size_type npos = ACE_WString::npos;

ACE_WString fromNullable(const wchar_t* text)
{
    return text != nullptr ? ACE_WString(text) : ACE_WString();
}
}

const ID ID::null;

ID::ID() = default;

ID::ID(const ACE_WString& text) : m_text(text)
{
}

ID::ID(const wchar_t* text) : m_text(fromNullable(text))
{
}

ID::ID(const char* text) : m_text(WideString::fromUtf8(text))
{
}

const ACE_WString& ID::getString() const
{
    return m_text;
}

bool ID::isNull() const
{
    return m_text.length() == 0;
}

ACE_WString ID::getScheme() const
{
    const auto colon = m_text.find(L':');
    return colon == npos ? ACE_WString() : m_text.substring(0, colon);
}

ACE_WString ID::getLibrary() const
{
    const auto question = m_text.find(L'?');
    if (question == npos)
        return ACE_WString();
    const auto colon = m_text.find(L':');
    const auto start = (colon == npos || colon > question) ? 0 : colon + 1;
    return m_text.substring(start, question - start);
}

bool ID::getQuery(ACE_WString& query) const
{
    const auto question = m_text.find(L'?');
    if (question == npos)
    {
        query = ACE_WString();
        return false;
    }
    const auto hash = m_text.find(L'#', question + 1);
    query = hash == npos ? m_text.substring(question + 1) : m_text.substring(question + 1, hash - question - 1);
    return true;
}

ACE_WString ID::getParameter() const
{
    const auto question = m_text.find(L'?');
    const auto hash = m_text.find(L'#', question == npos ? 0 : question + 1);
    return hash == npos ? ACE_WString() : m_text.substring(hash + 1);
}

ACE_WString ID::getPath() const
{
    const auto colon = m_text.find(L':');
    return colon == npos ? ACE_WString() : m_text.substring(colon + 1);
}

bool ID::operator==(const ID& other) const
{
    return m_text == other.m_text;
}

bool ID::operator!=(const ID& other) const
{
    return !(m_text == other.m_text);
}

bool ID::operator<(const ID& other) const
{
    return m_text < other.m_text;
}
