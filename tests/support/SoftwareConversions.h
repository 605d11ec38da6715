// Images through the software converter.
#pragma once

#include "CoreVideoUtils/PixelFormatConverter.h"
#include "tests/support/TestFrames.h"

namespace SoftwareTests
{

using KVZ::IPixelFormat;
using TestSupport::VBytes;

struct VSize
{
  uint32_t m_Width;
  uint32_t m_Height;
};

inline KVZ::VideoFrameInfo MakeInfo( IPixelFormat::Enum i_Format, VSize i_Size )
{
  return TestSupport::VideoInfo( i_Format, i_Size.m_Width, i_Size.m_Height );
}

inline size_t SizeOf( IPixelFormat::Enum i_Format, VSize i_Size )
{
  return static_cast<size_t>( KVZ::GetImageSize( i_Format, i_Size.m_Width, i_Size.m_Height ) );
}

// The target's bytes; empty where the conversion was refused.
inline VBytes Convert( KVZ::IPixelFormatConverter& io_rConverter, IPixelFormat::Enum i_Source, const VBytes& i_rSource, IPixelFormat::Enum i_Target,
  VSize i_Size )
{
  VBytes Target( SizeOf( i_Target, i_Size ), 0xA5 );
  const bool bDone = io_rConverter.Convert( MakeInfo( i_Source, i_Size ), i_rSource.data(), i_rSource.size(), i_Target, Target.data(),
    Target.size() );
  return bDone ? Target : VBytes();
}

inline VBytes Convert( IPixelFormat::Enum i_Source, const VBytes& i_rSource, IPixelFormat::Enum i_Target, VSize i_Size,
  const KVZ::VColourRecord& i_rColour = {} )
{
  CoreVideoUtils::VPixelFormatConverter Converter;
  Converter.SetColourCorrection( i_rColour );
  return Convert( Converter, i_Source, i_rSource, i_Target, i_Size );
}

}
