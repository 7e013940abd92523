#include "BOStream.h"

BOStream::BOStream(bool startNow) : m_startNow(startNow)
{
}

bool BOStream::startNow() const
{
    return m_startNow;
}
