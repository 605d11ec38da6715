// JPEG images as TurboJPEG makes them by itself, in memory of its own.
#pragma once

#include "tests/support/TestFrames.h"

#include <gtest/gtest.h>
#include <turbojpeg.h>

namespace TestSupport
{

// What one of its functions makes: called with the compressor and where the image and its size go.
template<class TCompress>
VBytes MakeTurboJPEG( const TCompress& i_rCompress )
{
  const tjhandle Handle = tjInitCompress();
  unsigned char* pImage = nullptr;
  unsigned long Size = 0;
  EXPECT_EQ( i_rCompress( Handle, &pImage, &Size ), 0 );
  const VBytes Image( pImage, pImage + Size );
  tjFree( pImage );
  tjDestroy( Handle );
  return Image;
}

struct VTurboJPEGOptions
{
  int m_Format = TJPF_RGB;
  int m_Subsampling = TJSAMP_444;
  int m_Quality = 90;
  int m_Flags = 0;
};

inline VBytes TurboJPEG( const VBytes& i_rPixels, int i_Width, int i_Height, const VTurboJPEGOptions& i_rOptions = {} )
{
  return MakeTurboJPEG(
    [&]( tjhandle i_Handle, unsigned char** o_ppImage, unsigned long* o_pSize )
    {
      return tjCompress2( i_Handle, i_rPixels.data(), i_Width, 0, i_Height, i_rOptions.m_Format, o_ppImage, o_pSize, i_rOptions.m_Subsampling,
        i_rOptions.m_Quality, i_rOptions.m_Flags );
    } );
}

}
