// What the lens did to an image, and how fine a mesh must be that undoes it. No state, any thread.
#pragma once

#include "Core/VideoInterface/FrameRecords.h"

#include <array>
#include <cstdint>

namespace CoreVideoUtilsOpenGL
{

// A pixel at the distance r from the centre goes to r * ( 1 + k1 r^2 + k2 r^4 + k3 r^6 ).
struct VLens
{
  std::array<double, 2> m_Centre{};       // pixels of the image; (0, 0) for no correction
  std::array<double, 3> m_Parameters{};   // k1, k2, k3, for pixels

  bool IsOff() const { return m_Centre[0] == 0.0 && m_Centre[1] == 0.0; }
};

// "Tarvo2Parameter" has no k3. Another model than the two, and values that are no numbers, correct nothing.
VLens MakeLens( const KVZ::VLensDistortionRecord& i_rRecord );

// Where a pixel of the image goes.
std::array<double, 2> Undistort( const VLens& i_rLens, const std::array<double, 2>& i_rPixel );

struct VMeshCells
{
  uint32_t m_Columns = 1;
  uint32_t m_Rows = 1;
};

// The most that the mesh's straight lines may miss the true place of a pixel by, in pixels.
constexpr double MeshTolerance = 0.1;

// So many cells that the mesh keeps to that; but none is made smaller than a pixel, which is fine enough for images that are bent to several
// times their size. One cell where nothing is corrected.
VMeshCells CellsFor( const VLens& i_rLens, uint32_t i_Width, uint32_t i_Height );

}
