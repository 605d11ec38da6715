// The binding to the flat functions: what is taken from which library, and the order of arguments where the generations differ.
#include "VendorInterfaces/BlueVelvetLoader.h"

#include <gtest/gtest.h>

#include <cstddef>

namespace BlueVelvet
{

TEST( BlueVelvetLoader, ALibraryThatIsMissingOrLacksFunctionsGivesNone )
{
  EXPECT_EQ( VRuntimeLibrary( "libNoSuchVendorRuntime.so" ).Functions(), nullptr );
  EXPECT_EQ( VRuntimeLibrary( "libm.so.6" ).Functions(), nullptr );
}

// A library of the older generation: it has no bfcGetVideoInfo, and takes the memory format before the update method.
TEST( BlueVelvetLoader, AnOlderLibraryTellsSizesByItsOwnFunctions )
{
  const VRuntimeLibrary Library( OLDER_BLUE_VELVET );
  ASSERT_NE( Library.Functions(), nullptr );
  const VFlatFunctions& rFunctions = *Library.Functions();
  EXPECT_EQ( rFunctions.bfcGetVideoInfo, nullptr );
  EXPECT_EQ( BlueVelvetLinePixels( rFunctions, 11 ), 11u );
  EXPECT_EQ( BlueVelvetLineBytes( rFunctions, 11, 8 ), 1108u );
  EXPECT_EQ( BlueVelvetFrameLines( rFunctions, 11, 1 ), 1101u );
  EXPECT_EQ( BlueVelvetGolden( rFunctions, 11, 8, 1 ), 110801u );
  CBlueVelvet4* pCard = BlueVelvetFactory4( rFunctions );
  EXPECT_EQ( pCard, nullptr ) << "a library may refuse to make a card object";
  BlueVelvetDestroy( pCard );
}

TEST( BlueVelvet, ANewerLibraryTakesTheUpdateMethodBeforeTheMemoryFormat )
{
  VFlatFunctions Functions;
  Functions.bfcGetVideoInfo = []( int i_Mode, int i_UpdateMethod, int i_MemoryFormat, uint32_t* o_pWidth, uint32_t* o_pHeight, uint32_t* o_pLine,
                                uint32_t* o_pFrame, uint32_t* o_pGolden ) -> BErr
  {
    const uint32_t Number = static_cast<uint32_t>( i_Mode * 10000 + i_UpdateMethod * 100 + i_MemoryFormat );
    *o_pWidth = Number + 1000000;
    *o_pHeight = Number + 2000000;
    *o_pLine = Number + 3000000;
    *o_pFrame = Number + 4000000;
    *o_pGolden = Number + 5000000;
    return i_Mode == 46 ? 1 : 0;
  };
  EXPECT_EQ( BlueVelvetLinePixels( Functions, 11 ) / 10000, 111u );
  EXPECT_EQ( BlueVelvetLineBytes( Functions, 11, 3 ), 3110103u );
  EXPECT_EQ( BlueVelvetFrameLines( Functions, 11, 1 ) / 100, 21101u );
  EXPECT_EQ( BlueVelvetGolden( Functions, 11, 3, 1 ), 5110103u );
  EXPECT_EQ( BlueVelvetGolden( Functions, 46, 3, 1 ), 0u ) << "what a failing call left behind counts for nothing";
}

TEST( BlueVelvet, TheDecodeRecordLiesAsTheDecoderExpects )
{
  EXPECT_EQ( offsetof( VHancDecodeRecord, m_Samples ), 16u );
  EXPECT_EQ( offsetof( VHancDecodeRecord, m_Timecodes ), 20u );
  EXPECT_EQ( offsetof( VHancDecodeRecord, m_pPackets ), 76u );
  EXPECT_EQ( offsetof( VHancDecodeRecord, m_AudioSource ), 92u );
  EXPECT_EQ( offsetof( VHancDecodeRecord, m_SplitMask ), 160u );
  EXPECT_EQ( offsetof( VHancDecodeRecord, m_MostSamples ), 164u );
}

}
