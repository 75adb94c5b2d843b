#include "support/MessageCodes.h"

namespace glimmet {

std::string FourCharText(uint32_t code)
{
    std::string text(4, ' ');
    for (int i = 0; i < 4; ++i)
        text[size_t(i)] = char((code >> (24 - 8 * i)) & 0xff);
    return text;
}

}  // namespace glimmet
