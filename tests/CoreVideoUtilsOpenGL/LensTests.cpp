// The lens: where its correction moves pixels to, how exactly the mesh does it, and what inversion has to do with it.
#include "CoreVideoUtilsOpenGL/LensMesh.h"
#include "tests/CoreVideoUtilsOpenGL/Images.h"

#include <algorithm>
#include <cmath>

using namespace OpenGLTests;
using namespace CoreVideoUtilsOpenGL;

namespace
{

using VPoint = std::array<double, 2>;

// How far the mesh's triangles lead points away from where they belong, at most: along all sides.
double ErrorOfMesh( const VLens& i_rLens, uint32_t i_Width, uint32_t i_Height )
{
  const VMeshCells Cells = CellsFor( i_rLens, i_Width, i_Height );
  const auto At = [&]( double i_Column, double i_Row ) {
    return Undistort( i_rLens, { i_Column * i_Width / Cells.m_Columns, i_Row * i_Height / Cells.m_Rows } );
  };
  double Largest = 0.0;
  const auto Check = [&]( double i_Column, double i_Row, double i_AcrossColumns, double i_AcrossRows )
  {
    const VPoint A = At( i_Column, i_Row );
    const VPoint B = At( i_Column + i_AcrossColumns, i_Row + i_AcrossRows );
    for( const double Part : { 0.25, 0.5, 0.75 } )
    {
      const VPoint True = At( i_Column + Part * i_AcrossColumns, i_Row + Part * i_AcrossRows );
      Largest = std::max( Largest, std::hypot( A[0] + ( B[0] - A[0] ) * Part - True[0], A[1] + ( B[1] - A[1] ) * Part - True[1] ) );
    }
  };
  for( uint32_t Row = 0; Row <= Cells.m_Rows; ++Row )
  {
    for( uint32_t Column = 0; Column <= Cells.m_Columns; ++Column )
    {
      const double Right = Column < Cells.m_Columns ? 1.0 : 0.0;
      const double Down = Row < Cells.m_Rows ? 1.0 : 0.0;
      Check( Column, Row, Right, 0.0 );
      Check( Column, Row, 0.0, Down );
      Check( Column + Right, Row, -Right, Down );
    }
  }
  return Largest;
}

}

// A corner of this image is 1102 pixels from its middle. Each parameter alone moves it by the part of that distance that is named: up to where the
// image would fold, and on the other side to ten times its size, which no lens does.
TEST( LensMesh, KeepsToATenthOfAPixel )
{
  constexpr uint32_t Width = 1920;
  constexpr uint32_t Height = 1080;
  const double Square = 960.0 * 960.0 + 540.0 * 540.0;
  for( const double Part : { -0.33, 0.1, 0.5, 2.0, 9.0 } )
  {
    for( const std::array<double, 3>& rK : { std::array<double, 3>{ Part / Square, 0.0, 0.0 }, { 0.0, 0.6 * Part / Square / Square, 0.0 },
           { 0.0, 0.0, 0.4 * Part / Square / Square / Square },
           { Part / Square, -0.5 * Part / Square / Square, 0.1 * Part / Square / Square / Square } } )
    {
      EXPECT_LE( ErrorOfMesh( { { 960.0, 540.0 }, rK }, Width, Height ), MeshTolerance );
    }
  }
  EXPECT_LE( ErrorOfMesh( { { 100.0, 1000.0 }, { 1.0 / Square, 0.0, 0.0 } }, Width, Height ), MeshTolerance );
  const VMeshCells Quad = CellsFor( {}, Width, Height );
  EXPECT_EQ( 1u, Quad.m_Columns * Quad.m_Rows );
}

// Red rises by a level a column, green a row: what is found at a place tells where it came from.
TEST( Lens, MovesPixelsAwayFromTheCentreOrTowardsIt )
{
  constexpr uint32_t Size = 256;
  VImage Ramp = MakeImage( IPixelFormat::ER8G8B8, Size, Size );
  for( size_t Index = 0; Index < Size * Size; ++Index )
  {
    Ramp.m_Bytes[3 * Index] = static_cast<uint8_t>( Index % Size );
    Ramp.m_Bytes[3 * Index + 1] = static_cast<uint8_t>( Index / Size );
  }
  for( const double K : { -4e-6, 4e-6 } )
  {
    const VLensDistortionRecord Record = MakeLensRecord( { 100.0, 140.0 }, { K, K * 1e-5, 0.0 } );
    const VBytes Drawn = Corrected( Ramp, IPixelFormat::ER8G8B8, Record );
    ASSERT_EQ( Ramp.m_Bytes.size(), Drawn.size() );
    for( uint32_t Row = 20; Row < Size - 20; Row += 12 )
    {
      for( uint32_t Column = 20; Column < Size - 20; Column += 12 )
      {
        const VPoint To = Undistort( MakeLens( Record ), { Column + 0.5, Row + 0.5 } );
        if( To[0] < 0 || To[1] < 0 || To[0] >= Size || To[1] >= Size )
        {
          continue;
        }
        const size_t Pixel = static_cast<size_t>( To[1] ) * Size + static_cast<size_t>( To[0] );
        ASSERT_NEAR( Column, Drawn[3 * Pixel], 1.5 ) << Row << ", " << K;
        ASSERT_NEAR( Row, Drawn[3 * Pixel + 1], 1.5 ) << Column << ", " << K;
      }
    }
  }
}

// What comes in from outside is black.
TEST( Lens, LeavesBlackWhereThereIsNoImage )
{
  VImage White = MakeImage( IPixelFormat::ER8G8B8, 64, 64 );
  std::fill( White.m_Bytes.begin(), White.m_Bytes.end(), uint8_t{ 255 } );
  const VBytes Shrunk = Corrected( White, IPixelFormat::ER8G8B8u8, MakeLensRecord( { 32.0, 32.0 }, { -1e-4, 0.0, 0.0 } ) );
  ASSERT_EQ( 64u * 64 * 4, Shrunk.size() );
  EXPECT_EQ( 0, Shrunk[0] );
  EXPECT_NEAR( 127.5, Shrunk[3], 1.0 );
  EXPECT_EQ( 255, Shrunk[4 * ( 32 * 64 + 32 )] );
}

TEST( Lens, CorrectsNothingWithItsCentreAtTheOriginOrWithoutAModel )
{
  const VImage Image = MakeNoise( IPixelFormat::EBayerGB8, 96, 40 );
  const auto With = [&]( VLensDistortionRecord::ERadialModel i_Model, std::array<double, 2> i_Centre, std::array<double, 3> i_Parameters ) {
    return Corrected( Image, IPixelFormat::ER8G8B8, { i_Model, i_Centre, i_Parameters } );
  };
  const VBytes Plain = InOpenGL( Image, IPixelFormat::ER8G8B8 );
  const VBytes Curved = With( VLensDistortionRecord::ETarvo3Parameter, { 48.0, 20.0 }, { 1e-4, 0.0, 0.0 } );
  EXPECT_NE( Plain, Curved );
  EXPECT_EQ( Plain, With( VLensDistortionRecord::ETarvo3Parameter, { 0.0, 0.0 }, { 1e-3, 1e-3, 1.0 } ) );
  EXPECT_EQ( Plain, With( VLensDistortionRecord::ETarvo3Parameter, { 48.0, NAN }, { 1e-4, 0.0, 0.0 } ) );
  EXPECT_EQ( Plain, With( VLensDistortionRecord::EBadRadialModel, { 48.0, 20.0 }, { 1e-4, 0.0, 0.0 } ) );
  EXPECT_EQ( Curved, With( VLensDistortionRecord::ETarvo2Parameter, { 48.0, 20.0 }, { 1e-4, 0.0, 1e-8 } ) ) << "the third one is not its own";
}

// The rows of a frame that is stored bottom-up, turned before or while it is drawn, with a lens whose centre lies in the upper half: were the mesh
// turned too, its centre would be.
TEST( Lens, StaysWhereItIsWhenTheImageIsInverted )
{
  const VImage Image = MakeNoise( IPixelFormat::ER8G8B8, 40, 30 );
  VImage BottomUp = Image;
  BottomUp.m_Info.m_bInverted = true;
  for( size_t Row = 0; Row < 30; ++Row )
  {
    std::copy_n( Image.m_Bytes.begin() + static_cast<std::ptrdiff_t>( Row * 120 ), 120,
      BottomUp.m_Bytes.begin() + static_cast<std::ptrdiff_t>( ( 29 - Row ) * 120 ) );
  }
  EXPECT_EQ( Image.m_Bytes, InOpenGL( BottomUp, IPixelFormat::ER8G8B8 ) );
  const VLensDistortionRecord Record = MakeLensRecord( { 20.0, 8.0 }, { 1e-4, 0.0, 0.0 } );
  EXPECT_LE( LargestDifference( Corrected( Image, IPixelFormat::ER8G8B8, Record ), Corrected( BottomUp, IPixelFormat::ER8G8B8, Record ) ), 2 );
}
