// What a reader finds in a file that may end anywhere.
#pragma once

#include "tests/support/SmallTvidFile.h"

#include <optional>

namespace WriterContract
{

constexpr uint32_t Width = 48;   // suits every pixel format
constexpr uint32_t Height = 4;
constexpr std::ptrdiff_t PictureBytes = Width * Height * 2;
constexpr std::ptrdiff_t SoundBytes = 40;

using TarvoVideo::VFound;   // finished: all tables are there, and right

// Each gives nothing for a file that cannot be read at all.
std::optional<VFound> ReadTvid( const TestSupport::VBytes& i_rBytes );
std::optional<VFound> ReadMov( const TestSupport::VBytes& i_rBytes );
std::optional<VFound> ReadAvi( const TestSupport::VBytes& i_rBytes );
std::optional<VFound> ReadMkv( const TestSupport::VBytes& i_rBytes );

}
