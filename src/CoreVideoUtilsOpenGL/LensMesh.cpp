#include "CoreVideoUtilsOpenGL/LensMesh.h"

#include <algorithm>
#include <cmath>

namespace CoreVideoUtilsOpenGL
{

namespace
{

constexpr double SmallestCell = 1.0;

// The distance from the lens's centre to the image's furthest corner.
double Reach( const VLens& i_rLens, uint32_t i_Width, uint32_t i_Height )
{
  const double X = std::max( std::abs( i_rLens.m_Centre[0] ), std::abs( i_Width - i_rLens.m_Centre[0] ) );
  const double Y = std::max( std::abs( i_rLens.m_Centre[1] ), std::abs( i_Height - i_rLens.m_Centre[1] ) );
  return std::hypot( X, Y );
}

// No second derivative of the warp is larger, in any direction, within that distance.
double Curvature( const VLens& i_rLens, double i_Reach )
{
  const double Square = i_Reach * i_Reach;
  const auto& rK = i_rLens.m_Parameters;
  return i_Reach * ( 6.0 * std::abs( rK[0] ) + Square * ( 20.0 * std::abs( rK[1] ) + Square * 42.0 * std::abs( rK[2] ) ) );
}

}

VLens MakeLens( const KVZ::VLensDistortionRecord& i_rRecord )
{
  using VRecord = KVZ::VLensDistortionRecord;
  VLens Lens = { i_rRecord.m_Centre, i_rRecord.m_Parameters };
  if( i_rRecord.m_RadialModel == VRecord::ETarvo2Parameter )
  {
    Lens.m_Parameters[2] = 0.0;
  }
  const auto IsFinite = []( double i_Value ) { return std::isfinite( i_Value ); };
  const bool bKnown = i_rRecord.m_RadialModel == VRecord::ETarvo2Parameter || i_rRecord.m_RadialModel == VRecord::ETarvo3Parameter;
  const bool bFinite = std::all_of( Lens.m_Centre.begin(), Lens.m_Centre.end(), IsFinite ) &&
    std::all_of( Lens.m_Parameters.begin(), Lens.m_Parameters.end(), IsFinite );
  return bKnown && bFinite ? Lens : VLens();
}

std::array<double, 2> Undistort( const VLens& i_rLens, const std::array<double, 2>& i_rPixel )
{
  if( i_rLens.IsOff() )
  {
    return i_rPixel;
  }
  const double X = i_rPixel[0] - i_rLens.m_Centre[0];
  const double Y = i_rPixel[1] - i_rLens.m_Centre[1];
  const double D = X * X + Y * Y;
  const auto& rK = i_rLens.m_Parameters;
  const double Scale = 1.0 + D * ( rK[0] + D * ( rK[1] + D * rK[2] ) );
  return { X * Scale + i_rLens.m_Centre[0], Y * Scale + i_rLens.m_Centre[1] };
}

// Within a triangle a straight map misses one of second derivative c by at most c r^2 / 2, where r is the radius of the smallest circle around the
// triangle: that of half a square cell of side a is a / sqrt( 2 ).
VMeshCells CellsFor( const VLens& i_rLens, uint32_t i_Width, uint32_t i_Height )
{
  if( i_rLens.IsOff() )
  {
    return {};
  }
  const double Cell = std::max( SmallestCell, std::sqrt( 4.0 * MeshTolerance / Curvature( i_rLens, Reach( i_rLens, i_Width, i_Height ) ) ) );
  const auto Count = [Cell]( uint32_t i_Pixels ) { return static_cast<uint32_t>( std::max( 1.0, std::ceil( i_Pixels / Cell ) ) ); };
  return { Count( i_Width ), Count( i_Height ) };
}

}
