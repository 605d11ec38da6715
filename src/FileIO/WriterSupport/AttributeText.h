// Attributes as text, for containers whose tags hold nothing else.
#pragma once

#include "Core/VideoInterface/VideoAttributes.h"

#include <string>

namespace WriterSupport
{

// Numbers in decimal, floats with the fewest digits that give the same value back; bools are "true" and "false"; texts as they stand. Empty
// for a key that is absent.
std::string GetAttributeText( const KVZ::IVideoAttributes& i_rAttributes, const std::string& i_rKey );

}
