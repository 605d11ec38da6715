#include "cards/bluefish444/HancStream.h"

#include <algorithm>
#include <array>
#include <cstring>
#include <vector>

namespace VirtualCards
{

namespace
{

namespace Place = BlueVelvet::TimecodePlace;
namespace Flag = BlueVelvet::SampleFlag;

// Then come the samples: 32 bits, interleaved.
struct VHancHeader
{
  uint32_t m_Magic = 0;
  uint32_t m_Places = 0;   // a bit for each timecode that is there
  std::array<uint64_t, 4> m_Timecodes{};
  uint32_t m_Channels = 0;
  uint32_t m_Samples = 0;   // per channel
};

constexpr uint32_t HancMagic = 0x434E4148;   // "HANC"
constexpr uint32_t MostChannels = 16;
constexpr uint32_t MostSamples = 2002;   // at 23.98 frames a second
static_assert( sizeof( VHancHeader ) + MostChannels * MostSamples * sizeof( int32_t ) <= BlueVelvet::HancBytes );

constexpr uint32_t FirstUpperChannelBit = 10;   // bits 8 and 9 are the analogue outputs
constexpr uint32_t LowerChannels = 8;
constexpr uint64_t DropFrameBit = 1ull << 10;
constexpr uint64_t FieldMarkBit = 1ull << 27;
constexpr uint64_t FieldMarkBitOf25 = 1ull << 59;   // SMPTE ST 12-1 puts it elsewhere at this rate

uint64_t Digits( uint32_t i_Value ) { return uint64_t{ i_Value / 10 } << 8 | i_Value % 10; }

std::vector<uint32_t> ChannelsOf( uint32_t i_Mask )
{
  std::vector<uint32_t> Channels;
  for( uint32_t Channel = 0; Channel < MostChannels; ++Channel )
  {
    const uint32_t Bit = Channel < LowerChannels ? Channel : Channel - LowerChannels + FirstUpperChannelBit;
    if( i_Mask >> Bit & 1 )
    {
      Channels.push_back( Channel );
    }
  }
  return Channels;
}

uint32_t BytesPerSample( uint32_t i_Flags ) { return i_Flags & Flag::Bits16 ? 2 : i_Flags & Flag::Bits24 ? 3 : 4; }

// Gives the number of samples of all channels together.
uint32_t DecodeSamples( const VHancHeader& i_rHeader, const uint8_t* i_pSamples, BlueVelvet::VHancDecodeRecord& io_rRecord )
{
  const std::vector<uint32_t> Channels = ChannelsOf( io_rRecord.m_ChannelMask );
  const uint32_t Samples = i_rHeader.m_Channels == 0 ? 0 : std::min( uint32_t{ i_rHeader.m_Samples }, uint32_t{ io_rRecord.m_MostSamples } );
  const uint32_t Bytes = BytesPerSample( io_rRecord.m_SampleFlags );
  uint8_t* pOut = static_cast<uint8_t*>( io_rRecord.m_pSamples );
  for( uint32_t Sample = 0; Sample < Samples; ++Sample )
  {
    for( const uint32_t Channel : Channels )
    {
      int32_t Value = 0;
      if( Channel < i_rHeader.m_Channels )
      {
        std::memcpy( &Value, i_pSamples + ( size_t{ Sample } * i_rHeader.m_Channels + Channel ) * sizeof( Value ), sizeof( Value ) );
      }
      Value >>= 32 - 8 * Bytes;
      std::memcpy( pOut, &Value, Bytes );   // little-endian
      pOut += Bytes;
    }
  }
  return Samples * static_cast<uint32_t>( Channels.size() );
}

}

uint64_t TimecodeWord( const VSignalTimecode& i_rTimecode )
{
  const KVZ::ITimecode& rLabel = i_rTimecode.m_Label;
  uint64_t Word = Digits( rLabel.m_Hours ) << 48 | Digits( rLabel.m_Minutes ) << 32 | Digits( rLabel.m_Seconds ) << 16 | Digits( rLabel.m_Frames );
  if( rLabel.m_Standard == KVZ::ITimecodeStandard::ETimecode30Drop )
  {
    Word |= DropFrameBit;
  }
  if( i_rTimecode.m_bFieldMark )
  {
    Word |= rLabel.m_Standard == KVZ::ITimecodeStandard::ETimecode25 ? FieldMarkBitOf25 : FieldMarkBit;
  }
  return Word;
}

void EncodeHanc( const VSignalFrame& i_rSignal, const VSound& i_rSound, uint8_t* o_pHanc )
{
  VHancHeader Header;
  Header.m_Magic = HancMagic;
  if( i_rSignal.m_Timecode )
  {
    Header.m_Timecodes.fill( TimecodeWord( *i_rSignal.m_Timecode ) );
    Header.m_Places = 1u << Place::RP188VITC | 1u << Place::RP188LTC | ( i_rSignal.m_pStandard->m_Height <= 576 ? 1u << Place::SDVITC : 0 );
  }
  if( i_rSound.Exists() && i_rSound.m_Samples <= MostSamples )
  {
    Header.m_Channels = std::min( i_rSound.m_SignalChannels, MostChannels );
    Header.m_Samples = i_rSound.m_Samples;
    i_rSound.Write( { 32, Header.m_Channels }, o_pHanc + sizeof( Header ) );
  }
  std::memcpy( o_pHanc, &Header, sizeof( Header ) );
}

bool DecodeHanc( const uint8_t* i_pHanc, BlueVelvet::VHancDecodeRecord& io_rRecord )
{
  VHancHeader Header;
  std::memcpy( &Header, i_pHanc, sizeof( Header ) );
  if( Header.m_Magic != HancMagic || io_rRecord.m_SampleFlags & Flag::BigEndian || io_rRecord.m_AudioSource != 0 )
  {
    return false;
  }
  for( uint32_t Index = 0; Index < Header.m_Timecodes.size(); ++Index )
  {
    if( Header.m_Places >> Index & 1 )
    {
      io_rRecord.m_Timecodes[Index] = Header.m_Timecodes[Index];
    }
  }
  io_rRecord.m_Samples = io_rRecord.m_pSamples ? DecodeSamples( Header, i_pHanc + sizeof( Header ), io_rRecord ) : 0;
  io_rRecord.m_Packets = 0;
  return true;
}

}
