#include "host/TstringArray.h"

unsigned int TstringArray::length() const
{
    return static_cast<unsigned int>(fTexts.size());
}

const Tstring& TstringArray::operator[](unsigned int index) const
{
    return fTexts[index];
}

void TstringArray::append(const Tstring& text)
{
    fTexts.push_back(text);
}
