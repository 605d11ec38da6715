#include "CoreVideoUtils/ColourCorrector.h"

#include "CoreVideoUtils/ColourRows.h"

#include <algorithm>
#include <cmath>

namespace CoreVideoUtils
{

namespace
{

// Where every channel that is not the mean is at an end of its range already; what is no number counts as grey.
constexpr float FurthestFromMean = -65536.0f;

// Limited before it is rounded: a gamma of 0 or below gives infinities and, at 0, no number at all.
uint8_t ToByte( float i_Value ) { return i_Value > 0.0f ? static_cast<uint8_t>( std::min( i_Value, 255.0f ) + 0.5f ) : uint8_t{ 0 }; }

}

void VColourCorrector::SetColourCorrection( const KVZ::VColourRecord& i_rColour )
{
  m_SaturationOffset = i_rColour.m_Saturation - 1.0f;
  const bool bRebuild = i_rColour.m_GammaCorrection != 1.0f && i_rColour.m_GammaCorrection != m_Gamma;
  m_Gamma = i_rColour.m_GammaCorrection;
  if( !bRebuild )
  {
    return;
  }
  for( size_t Entry = 0; Entry < m_Table.size(); ++Entry )
  {
    m_Table[Entry] = ToByte( 255.0f * std::pow( static_cast<float>( Entry ) / 255.0f, 1.0f / m_Gamma ) );
  }
}

void VColourCorrector::Apply( uint8_t* io_pPixels, size_t i_Pixels, size_t i_BytesPerPixel ) const
{
  if( m_Gamma != 1.0f )
  {
    for( uint8_t* pPixel = io_pPixels; pPixel != io_pPixels + i_Pixels * i_BytesPerPixel; pPixel += i_BytesPerPixel )
    {
      pPixel[0] = m_Table[pPixel[0]];
      pPixel[1] = m_Table[pPixel[1]];
      pPixel[2] = m_Table[pPixel[2]];
    }
  }
  if( m_SaturationOffset != 0.0f )
  {
    MoveToMean( std::max( std::min( 1.0f, -m_SaturationOffset ), FurthestFromMean ), io_pPixels, i_Pixels, i_BytesPerPixel );
  }
}

}
