#include "FileIO/RapidAVI/StreamFormats.h"

#include <algorithm>

namespace RapidAVI
{

namespace
{

using KVZ::IAudioSampleFormat;

constexpr uint32_t AudioBufferSize = 0x1000;

// Microsoft's wave format extensible: the format's number, then the same fourteen bytes.
constexpr std::array<uint8_t, 16> SubFormat( uint8_t i_Number )
{
  return { i_Number, 0, 0, 0, 0, 0, 0x10, 0, 0x80, 0, 0, 0xAA, 0, 0x38, 0x9B, 0x71 };
}
constexpr auto PCMFormat = SubFormat( 1 );
constexpr auto FloatFormat = SubFormat( 3 );

struct VSampleRow
{
  IAudioSampleFormat::Enum m_Format;
  uint16_t m_Bits;
  const std::array<uint8_t, 16>& m_rSubFormat;
};

constexpr std::array SampleRows = {
  VSampleRow{ IAudioSampleFormat::EInt16, 16, PCMFormat },
  VSampleRow{ IAudioSampleFormat::EInt24, 24, PCMFormat },
  VSampleRow{ IAudioSampleFormat::EInt32, 32, PCMFormat },
  VSampleRow{ IAudioSampleFormat::EFloat32, 32, FloatFormat },
  VSampleRow{ IAudioSampleFormat::EUInt8, 8, PCMFormat },
};

// Front left, right and centre, low frequency, back left and right, sides.
constexpr uint32_t GetChannelMask( uint32_t i_Channels )
{
  switch( i_Channels )
  {
    case 1: return 0x4;
    case 2: return 0x3;
    case 3: return 0x7;
    case 4: return 0x33;
    case 8: return 0x63F;
    default: return 0;
  }
}

uint32_t GetBlockSize( const KVZ::AudioFrameInfo& i_rAudio ) { return KVZ::GetBytesPerSample( i_rAudio.m_SampleFormat ) * i_rAudio.m_Channels; }

}

VStreamHeader MakeAudioStreamHeader( const VFileDescription& i_rFile )
{
  VStreamHeader Header;
  Header.m_Type = FourCC( "auds" );
  Header.m_Handler = { 1, 0, 0, 0 };
  Header.m_Scale = 1;
  Header.m_Rate = i_rFile.m_Audio.m_SampleRate;
  Header.m_SuggestedBufferSize = AudioBufferSize;
  Header.m_SampleSize = GetBlockSize( i_rFile.m_Audio );
  return Header;
}

VWaveFormat MakeWaveFormat( const KVZ::AudioFrameInfo& i_rAudio )
{
  VWaveFormat Format;
  Format.m_Channels = static_cast<uint16_t>( i_rAudio.m_Channels );
  Format.m_SampleRate = i_rAudio.m_SampleRate;
  Format.m_BytesPerSecond = GetBlockSize( i_rAudio ) * i_rAudio.m_SampleRate;
  Format.m_BlockAlign = static_cast<uint16_t>( GetBlockSize( i_rAudio ) );
  Format.m_ChannelMask = GetChannelMask( i_rAudio.m_Channels );
  Format.m_SubFormat = PCMFormat;
  const auto Row = std::find_if( SampleRows.begin(), SampleRows.end(),
    [&]( const VSampleRow& i_rRow ) { return i_rRow.m_Format == i_rAudio.m_SampleFormat; } );
  if( Row != SampleRows.end() )
  {
    Format.m_BitsPerSample = Row->m_Bits;
    Format.m_ValidBitsPerSample = Row->m_Bits;
    Format.m_SubFormat = Row->m_rSubFormat;
  }
  return Format;
}

}
