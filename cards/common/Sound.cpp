#include "cards/common/Sound.h"

#include "cards/common/SampleCadence.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <cstring>
#include <numbers>

namespace VirtualCards
{

namespace
{

constexpr uint32_t TonePeriod = AudioRate / 1000;   // samples of one turn at 1 kHz
constexpr uint32_t ToneShift = TonePeriod / 16;     // samples from channel to channel
constexpr uint64_t RampChannelStep = 257;

std::array<int32_t, TonePeriod> MakeToneTable()
{
  std::array<int32_t, TonePeriod> Table{};
  const double Amplitude = 2147483647.0 * std::pow( 10.0, -18.0 / 20.0 );
  for( uint32_t i = 0; i < TonePeriod; ++i )
  {
    Table[i] = static_cast<int32_t>( std::lround( Amplitude * std::sin( 2.0 * std::numbers::pi * i / TonePeriod ) ) );
  }
  return Table;
}

const std::array<int32_t, TonePeriod> ToneTable = MakeToneTable();

int32_t ToneAt( uint64_t i_Sample, uint32_t i_Channel ) { return ToneTable[( i_Sample + i_Channel * ToneShift ) % TonePeriod]; }

int32_t RampAt( uint64_t i_Sample, uint32_t i_Channel )
{
  return static_cast<int32_t>( static_cast<uint32_t>( ( i_Sample + RampChannelStep * i_Channel ) & 0xFFFF ) << 16 );
}

template<uint32_t Bytes, class TAt>
void Fill( const VSound& i_rSound, uint32_t i_SignalChannels, uint32_t i_Channels, uint8_t* o_pBytes, TAt i_At )
{
  constexpr int Shift = 32 - 8 * static_cast<int>( Bytes );
  const uint32_t Carried = std::min( i_SignalChannels, i_Channels );
  for( uint32_t Sample = 0; Sample < i_rSound.m_Samples; ++Sample )
  {
    for( uint32_t Channel = 0; Channel < i_Channels; ++Channel, o_pBytes += Bytes )
    {
      const int32_t Value = Channel < Carried ? i_At( Sample, Channel ) >> Shift : 0;
      std::memcpy( o_pBytes, &Value, Bytes );   // little-endian
    }
  }
}

template<uint32_t Bytes>
void WriteAs( const VSound& i_rSound, uint32_t i_Channels, uint8_t* o_pBytes )
{
  const uint64_t First = i_rSound.m_FirstSample;
  if( i_rSound.m_bClip )
  {
    const int32_t* pClip = i_rSound.m_Clip.data();
    const uint32_t ClipChannels = i_rSound.m_ClipChannels;
    const uint32_t Carried = std::min( i_rSound.m_SignalChannels, ClipChannels );
    Fill<Bytes>( i_rSound, Carried, i_Channels, o_pBytes,
      [=]( uint32_t i_Sample, uint32_t i_Channel ) { return pClip[size_t{ i_Sample } * ClipChannels + i_Channel]; } );
    return;
  }
  const auto Tone = [=]( uint32_t i_Sample, uint32_t i_Channel ) { return ToneAt( First + i_Sample, i_Channel ); };
  const auto Ramp = [=]( uint32_t i_Sample, uint32_t i_Channel ) { return RampAt( First + i_Sample, i_Channel ); };
  switch( i_rSound.m_Audio )
  {
    case EAudio::Tone: Fill<Bytes>( i_rSound, i_rSound.m_SignalChannels, i_Channels, o_pBytes, Tone ); break;
    case EAudio::Ramp: Fill<Bytes>( i_rSound, i_rSound.m_SignalChannels, i_Channels, o_pBytes, Ramp ); break;
    default: std::memset( o_pBytes, 0, size_t{ Bytes } * i_Channels * i_rSound.m_Samples ); break;
  }
}

}

void VSound::Write( const VSoundLayout& i_rLayout, uint8_t* o_pBytes ) const
{
  switch( i_rLayout.m_Bits )
  {
    case 16: WriteAs<2>( *this, i_rLayout.m_Channels, o_pBytes ); break;
    case 24: WriteAs<3>( *this, i_rLayout.m_Channels, o_pBytes ); break;
    default: WriteAs<4>( *this, i_rLayout.m_Channels, o_pBytes ); break;
  }
}

}
