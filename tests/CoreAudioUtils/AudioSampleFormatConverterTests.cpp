#include "CoreAudioUtils/AudioSampleFormatConverter.h"
#include "tests/support/AssertionCapture.h"
#include "tests/support/LogCapture.h"
#include "tests/support/TestFrames.h"

#include <gtest/gtest.h>

#include <cmath>
#include <limits>

using CoreAudioUtils::ConvertSamples;
using KVZ::IAudioSampleFormat;

namespace
{

using TestSupport::VBytes;

// The arithmetic once more, on numbers instead of bytes: an integer sample as a fraction of full scale in 32 bits.
int64_t ReadInteger( IAudioSampleFormat::Enum i_Format, const uint8_t* i_pBytes )
{
  const size_t Size = KVZ::GetBytesPerSample( i_Format );
  int64_t Value = 0;
  for( size_t Byte = Size; Byte-- > 0; )
  {
    Value = Value * 256 + i_pBytes[Byte];
  }
  const int64_t Range = int64_t{ 1 } << ( 8 * Size );
  const int64_t Signed = Value >= Range / 2 ? Value - Range : Value;
  return Signed * ( ( int64_t{ 1 } << 32 ) / Range );
}

// A right shift of a negative number rounds down, as all of this does.
VBytes ToBytes( int64_t i_Value, size_t i_Size )
{
  VBytes Bytes;
  for( size_t Byte = 0; Byte < i_Size; ++Byte )
  {
    Bytes.push_back( static_cast<uint8_t>( i_Value >> 8 * Byte ) );
  }
  return Bytes;
}

VBytes FloatBytes( float i_Value )
{
  VBytes Bytes( 4 );
  std::memcpy( Bytes.data(), &i_Value, 4 );
  return Bytes;
}

VBytes FromFloat( float i_Value, IAudioSampleFormat::Enum i_Target )
{
  const auto Truncate = []( double i_Number ) { return static_cast<int64_t>( std::trunc( i_Number ) ); };
  switch( i_Target )
  {
    case IAudioSampleFormat::EInt32: return ToBytes( Truncate( i_Value * 65536.0 ), 4 );
    case IAudioSampleFormat::EInt24: return ToBytes( Truncate( i_Value * 65536.0 ) >> 8, 3 );
    case IAudioSampleFormat::EInt16: return ToBytes( Truncate( i_Value ), 2 );
    default: return ToBytes( Truncate( i_Value ), 1 );
  }
}

VBytes Reference( IAudioSampleFormat::Enum i_Source, IAudioSampleFormat::Enum i_Target, const uint8_t* i_pSample )
{
  if( i_Source == IAudioSampleFormat::EFloat32 )
  {
    float Value = 0;
    std::memcpy( &Value, i_pSample, 4 );
    return FromFloat( Value, i_Target );
  }
  const int64_t Full = ReadInteger( i_Source, i_pSample );
  switch( i_Target )
  {
    case IAudioSampleFormat::EFloat32: return FloatBytes( static_cast<float>( Full ) );
    case IAudioSampleFormat::EUInt8: return ToBytes( ( Full >> 24 ) + 128, 1 );
    default: return ToBytes( Full >> ( 32 - 8 * KVZ::GetBytesPerSample( i_Target ) ), KVZ::GetBytesPerSample( i_Target ) );
  }
}

bool IsSupported( IAudioSampleFormat::Enum i_Source, IAudioSampleFormat::Enum i_Target )
{
  static const std::set Signed = { IAudioSampleFormat::EInt16, IAudioSampleFormat::EInt24, IAudioSampleFormat::EInt32, IAudioSampleFormat::EFloat32 };
  const bool bSource = i_Source == IAudioSampleFormat::EInt8 || Signed.count( i_Source ) != 0;
  const bool bTarget = i_Target == IAudioSampleFormat::EUInt8 || Signed.count( i_Target ) != 0;
  return bSource && bTarget && i_Source != i_Target;
}

VBytes MakeSource( IAudioSampleFormat::Enum i_Format, size_t i_Samples )
{
  VBytes Bytes = TestSupport::Noise( i_Samples * KVZ::GetBytesPerSample( i_Format ), 1 );
  for( size_t Byte = 0; i_Format == IAudioSampleFormat::EFloat32 && Byte < Bytes.size(); Byte += 4 )
  {
    const auto Value = static_cast<float>( ReadInteger( IAudioSampleFormat::EInt32, &Bytes[Byte] ) / 65536.0 );   // what 16 bits hold, and a fraction
    std::memcpy( &Bytes[Byte], &Value, 4 );
  }
  return Bytes;
}

VBytes ConvertOne( IAudioSampleFormat::Enum i_Source, const VBytes& i_rSample, IAudioSampleFormat::Enum i_Target )
{
  VBytes Target( KVZ::GetBytesPerSample( i_Target ) );
  EXPECT_TRUE( ConvertSamples( { i_Source, 48000, 1 }, i_Target, i_rSample.data(), i_rSample.size(), Target.data() ) );
  return Target;
}

}

TEST( AudioSampleFormatConverter, EveryPairAgreesWithTheObviousArithmeticOrIsRefused )
{
  constexpr size_t Samples = 1000;
  for( int32_t Source = 0; Source <= 9; ++Source )
  {
    for( int32_t Target = 0; Target <= 9; ++Target )
    {
      const auto From = static_cast<IAudioSampleFormat::Enum>( Source );
      const auto To = static_cast<IAudioSampleFormat::Enum>( Target );
      SCOPED_TRACE( ToName( From ) + " to " + ToName( To ) );
      const VBytes Input = MakeSource( From, Samples );
      const size_t Size = CoreAudioUtils::GetConvertedSize( From, To, Input.size() );
      VBytes Output( Size + 1, 0xAA );
      const TestSupport::VLogCapture Log( "AudioSampleFormatConverter" );
      const bool bConverted = ConvertSamples( { From, 48000, 2 }, To, Input.data(), Input.size(), Output.data() );
      EXPECT_EQ( bConverted, IsSupported( From, To ) );
      if( !bConverted )
      {
        EXPECT_EQ( Log.Texts().at( 0 ), From == To ? "Data already in desired format" : "Unsupported audio sample conversion." );
        continue;
      }
      VBytes Expected;
      for( size_t Sample = 0; Sample < Samples; ++Sample )
      {
        TestSupport::Append( Expected, Reference( From, To, Input.data() + Sample * KVZ::GetBytesPerSample( From ) ) );
      }
      Expected.push_back( 0xAA );
      EXPECT_TRUE( Output == Expected );
    }
  }
}

TEST( AudioSampleFormatConverter, TheTwoDirectionsOfFloatDiffer )
{
  EXPECT_EQ( ConvertOne( IAudioSampleFormat::EInt16, { 1, 0 }, IAudioSampleFormat::EFloat32 ), FloatBytes( 65536.f ) );
  EXPECT_EQ( ConvertOne( IAudioSampleFormat::EFloat32, FloatBytes( 1.f ), IAudioSampleFormat::EInt32 ), ( VBytes{ 0, 0, 1, 0 } ) );
  EXPECT_EQ( ConvertOne( IAudioSampleFormat::EFloat32, FloatBytes( -1.5f ), IAudioSampleFormat::EInt16 ), ( VBytes{ 0xFF, 0xFF } ) );
  EXPECT_EQ( ConvertOne( IAudioSampleFormat::EFloat32, FloatBytes( 0.f ), IAudioSampleFormat::EUInt8 ), ( VBytes{ 0 } ) );
  EXPECT_EQ( ConvertOne( IAudioSampleFormat::EInt8, { 0 }, IAudioSampleFormat::EUInt8 ), ( VBytes{ 0x80 } ) );
  // Nothing is clipped: what leaves 16 bits wraps, what leaves 32 bits is the lowest value.
  EXPECT_EQ( ConvertOne( IAudioSampleFormat::EFloat32, FloatBytes( 40000.f ), IAudioSampleFormat::EInt16 ), ( VBytes{ 0x40, 0x9C } ) );
  for( const float Value : { 32768.f, -32769.f, 1e30f, std::numeric_limits<float>::infinity(), std::numeric_limits<float>::quiet_NaN() } )
  {
    EXPECT_EQ( ConvertOne( IAudioSampleFormat::EFloat32, FloatBytes( Value ), IAudioSampleFormat::EInt32 ), ( VBytes{ 0, 0, 0, 0x80 } ) );
  }
}

TEST( AudioSampleFormatConverter, AHalfSampleFrameIsAnAssertion )
{
  const TestSupport::VAssertionCapture Assertions;
  const VBytes Source( 6 );
  VBytes Target( 12 );
  EXPECT_TRUE( ConvertSamples( { IAudioSampleFormat::EInt16, 48000, 2 }, IAudioSampleFormat::EInt32, Source.data(), Source.size(), Target.data() ) );
  EXPECT_EQ( Assertions.Expressions(), std::vector<std::string>{ "i_SourceSize % Stride == 0" } );
}
