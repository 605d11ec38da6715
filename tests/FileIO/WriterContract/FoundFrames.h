// What a reader finds in a file that may end anywhere.
#pragma once

#include "tests/support/TestFrames.h"

#include <map>
#include <optional>

namespace WriterContract
{

constexpr uint32_t Width = 48;   // suits every pixel format
constexpr uint32_t Height = 4;
constexpr std::ptrdiff_t PictureBytes = Width * Height * 2;
constexpr std::ptrdiff_t SoundBytes = 40;

struct VFoundFrame
{
  TestSupport::VBytes m_Picture{};
  TestSupport::VBytes m_Sound{};   // none where the file ends behind the picture
};

struct VFoundFile
{
  std::map<uint64_t, VFoundFrame> m_Frames{};   // by key
  bool m_bFinished = false;                     // all tables are there, and right
};

// Each gives nothing for a file that cannot be read at all.
std::optional<VFoundFile> ReadTvid( const TestSupport::VBytes& i_rBytes );
std::optional<VFoundFile> ReadMov( const TestSupport::VBytes& i_rBytes );
std::optional<VFoundFile> ReadAvi( const TestSupport::VBytes& i_rBytes );
std::optional<VFoundFile> ReadMkv( const TestSupport::VBytes& i_rBytes );

}
