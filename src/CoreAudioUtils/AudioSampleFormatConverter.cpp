#include "CoreAudioUtils/AudioSampleFormatConverter.h"

#include "StageCoreRuntime/DebugServices.h"
#include "StageCoreRuntime/GlobalLog.h"

#include <array>
#include <bit>
#include <cstring>
#include <limits>

namespace CoreAudioUtils
{

static_assert( std::endian::native == std::endian::little );

namespace
{

using KVZ::IAudioSampleFormat;

// Truncation to int32 as the processor does it: what does not fit, and what is no number, becomes the lowest value.
int32_t Truncate( double i_Value )
{
  const bool bFits = i_Value > -2147483649.0 && i_Value < 2147483648.0;
  return bFits ? static_cast<int32_t>( i_Value ) : std::numeric_limits<int32_t>::min();
}

// Integer sources of TBytes bytes, shifted to the top of 32 bits.
template<size_t TBytes>
struct VInteger
{
  static constexpr size_t Bytes = TBytes;
  static int32_t Load( const uint8_t* i_pSource )
  {
    uint32_t Bits = 0;
    std::memcpy( reinterpret_cast<uint8_t*>( &Bits ) + 4 - TBytes, i_pSource, TBytes );
    return static_cast<int32_t>( Bits );
  }
};

float LoadFloat( const uint8_t* i_pSource )
{
  float Value;
  std::memcpy( &Value, i_pSource, sizeof( Value ) );
  return Value;
}

// A float as if it ran over the 16-bit range, with 16 more bits below.
struct VFloatWithFraction
{
  static constexpr size_t Bytes = 4;
  static int32_t Load( const uint8_t* i_pSource ) { return Truncate( LoadFloat( i_pSource ) * 65536.0 ); }
};

// The whole part of a float, at the low end.
struct VFloatWhole
{
  static constexpr size_t Bytes = 4;
  static int32_t Load( const uint8_t* i_pSource ) { return Truncate( LoadFloat( i_pSource ) ); }
};

// The top TBytes bytes of 32.
template<size_t TBytes>
struct VTop
{
  static constexpr size_t Bytes = TBytes;
  static void Store( int32_t i_Value, uint8_t* o_pTarget )
  {
    std::memcpy( o_pTarget, reinterpret_cast<const uint8_t*>( &i_Value ) + 4 - TBytes, TBytes );
  }
};

template<size_t TBytes>
struct VLow
{
  static constexpr size_t Bytes = TBytes;
  static void Store( int32_t i_Value, uint8_t* o_pTarget ) { std::memcpy( o_pTarget, &i_Value, TBytes ); }
};

struct VTopUnsigned8
{
  static constexpr size_t Bytes = 1;
  static void Store( int32_t i_Value, uint8_t* o_pTarget ) { *o_pTarget = static_cast<uint8_t>( ( i_Value >> 24 ) - 0x80 ); }
};

struct VFloatStore
{
  static constexpr size_t Bytes = 4;
  static void Store( int32_t i_Value, uint8_t* o_pTarget )
  {
    const float Value = static_cast<float>( i_Value );
    std::memcpy( o_pTarget, &Value, sizeof( Value ) );
  }
};

template<class TSource, class TTarget>
void Convert( const uint8_t* i_pSource, size_t i_Samples, uint8_t* o_pTarget )
{
  for( size_t Index = 0; Index < i_Samples; ++Index )
  {
    TTarget::Store( TSource::Load( i_pSource + Index * TSource::Bytes ), o_pTarget + Index * TTarget::Bytes );
  }
}

struct VRow
{
  IAudioSampleFormat::Enum m_Source;
  IAudioSampleFormat::Enum m_Target;
  void ( *m_pConvert )( const uint8_t*, size_t, uint8_t* );
};

constexpr std::array Rows = {
  VRow{ IAudioSampleFormat::EInt8, IAudioSampleFormat::EInt32, Convert<VInteger<1>, VTop<4>> },
  VRow{ IAudioSampleFormat::EInt16, IAudioSampleFormat::EInt32, Convert<VInteger<2>, VTop<4>> },
  VRow{ IAudioSampleFormat::EInt24, IAudioSampleFormat::EInt32, Convert<VInteger<3>, VTop<4>> },
  VRow{ IAudioSampleFormat::EFloat32, IAudioSampleFormat::EInt32, Convert<VFloatWithFraction, VTop<4>> },
  VRow{ IAudioSampleFormat::EInt8, IAudioSampleFormat::EInt24, Convert<VInteger<1>, VTop<3>> },
  VRow{ IAudioSampleFormat::EInt16, IAudioSampleFormat::EInt24, Convert<VInteger<2>, VTop<3>> },
  VRow{ IAudioSampleFormat::EInt32, IAudioSampleFormat::EInt24, Convert<VInteger<4>, VTop<3>> },
  VRow{ IAudioSampleFormat::EFloat32, IAudioSampleFormat::EInt24, Convert<VFloatWithFraction, VTop<3>> },
  VRow{ IAudioSampleFormat::EInt8, IAudioSampleFormat::EInt16, Convert<VInteger<1>, VTop<2>> },
  VRow{ IAudioSampleFormat::EInt24, IAudioSampleFormat::EInt16, Convert<VInteger<3>, VTop<2>> },
  VRow{ IAudioSampleFormat::EInt32, IAudioSampleFormat::EInt16, Convert<VInteger<4>, VTop<2>> },
  VRow{ IAudioSampleFormat::EFloat32, IAudioSampleFormat::EInt16, Convert<VFloatWhole, VLow<2>> },
  VRow{ IAudioSampleFormat::EInt8, IAudioSampleFormat::EUInt8, Convert<VInteger<1>, VTopUnsigned8> },
  VRow{ IAudioSampleFormat::EInt16, IAudioSampleFormat::EUInt8, Convert<VInteger<2>, VTopUnsigned8> },
  VRow{ IAudioSampleFormat::EInt24, IAudioSampleFormat::EUInt8, Convert<VInteger<3>, VTopUnsigned8> },
  VRow{ IAudioSampleFormat::EInt32, IAudioSampleFormat::EUInt8, Convert<VInteger<4>, VTopUnsigned8> },
  VRow{ IAudioSampleFormat::EFloat32, IAudioSampleFormat::EUInt8, Convert<VFloatWhole, VLow<1>> },
  VRow{ IAudioSampleFormat::EInt8, IAudioSampleFormat::EFloat32, Convert<VInteger<1>, VFloatStore> },
  VRow{ IAudioSampleFormat::EInt16, IAudioSampleFormat::EFloat32, Convert<VInteger<2>, VFloatStore> },
  VRow{ IAudioSampleFormat::EInt24, IAudioSampleFormat::EFloat32, Convert<VInteger<3>, VFloatStore> },
  VRow{ IAudioSampleFormat::EInt32, IAudioSampleFormat::EFloat32, Convert<VInteger<4>, VFloatStore> },
};

}

size_t GetConvertedSize( IAudioSampleFormat::Enum i_Source, IAudioSampleFormat::Enum i_Target, size_t i_SourceSize )
{
  const size_t SourceBytes = KVZ::GetBytesPerSample( i_Source );
  return SourceBytes == 0 ? 0 : i_SourceSize / SourceBytes * KVZ::GetBytesPerSample( i_Target );
}

bool ConvertSamples( const KVZ::AudioFrameInfo& i_rInfo, IAudioSampleFormat::Enum i_Target, const uint8_t* i_pSource, size_t i_SourceSize,
  uint8_t* o_pTarget )
{
  const size_t Bytes = KVZ::GetBytesPerSample( i_rInfo.m_SampleFormat );
  const size_t Stride = Bytes * i_rInfo.m_Channels;
  if( Stride != 0 )
  {
    KVZ_ASSERT( i_SourceSize % Stride == 0 );
  }
  if( i_rInfo.m_SampleFormat == i_Target )
  {
    KVZ_LOG_ERROR( "AudioSampleFormatConverter", "Data already in desired format" );
    return false;
  }
  for( const VRow& rRow : Rows )
  {
    if( rRow.m_Source == i_rInfo.m_SampleFormat && rRow.m_Target == i_Target )
    {
      rRow.m_pConvert( i_pSource, i_SourceSize / Bytes, o_pTarget );
      return true;
    }
  }
  KVZ_LOG_ERROR( "AudioSampleFormatConverter", "Unsupported audio sample conversion." );
  return false;
}

}
