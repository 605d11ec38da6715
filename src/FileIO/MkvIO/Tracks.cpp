#include "FileIO/MkvIO/Tracks.h"

#include "FileIO/MkvIO/ElementSetting.h"
#include "FileIO/MkvIO/Format.h"
#include "FileIO/WriterSupport/BitmapHeader.h"

#include <matroska/KaxSemantic.h>

#include <cstring>
#include <string>

namespace MkvIO
{

using namespace libmatroska;

namespace
{

enum ETrackType : uint64_t
{
  Video = 1,
  Audio = 2
};

// Numbers count from 1, and each track's is its unique id too.
KaxTrackEntry& AddTrack( KaxTracks& io_rTracks, uint64_t i_Number, ETrackType i_Type )
{
  auto& rTrack = libebml::AddNewChild<KaxTrackEntry>( io_rTracks );
  Set<KaxTrackNumber>( rTrack, i_Number );
  Set<KaxTrackUID>( rTrack, i_Number );
  Set<KaxTrackType>( rTrack, i_Type );
  Set<KaxTrackFlagLacing>( rTrack, 0u );
  return rTrack;
}

void FillPicture( KaxTrackVideo& o_rPicture, const KVZ::VideoFrameInfo& i_rVideo )
{
  Set<KaxVideoPixelWidth>( o_rPicture, i_rVideo.m_ImageWidth );
  Set<KaxVideoPixelHeight>( o_rPicture, i_rVideo.m_ImageHeight );
  Set<KaxVideoDisplayWidth>( o_rPicture, i_rVideo.m_ImageWidth );
  Set<KaxVideoDisplayHeight>( o_rPicture, i_rVideo.m_ImageHeight );
}

template<class TElement>
void SetBytes( libebml::EbmlMaster& io_rMaster, const void* i_pData, uint32_t i_Size )
{
  libebml::GetChild<TElement>( io_rMaster ).CopyBuffer( static_cast<const uint8_t*>( i_pData ), i_Size );
}

void FillCodec( KaxTrackEntry& o_rTrack, const KVZ::VideoFrameInfo& i_rVideo, const VVideoCodec& i_rCodec )
{
  Set<KaxCodecID>( o_rTrack, std::string( i_rCodec.m_pId ) );
  if( i_rCodec.m_Place == EFourCCPlace::BitmapHeader )
  {
    WriterSupport::VBitmapHeader Header;   // the bit count and the image's size, which follow from the format, are left at 0
    Header.m_Width = static_cast<int32_t>( i_rVideo.m_ImageWidth );
    Header.m_Height = static_cast<int32_t>( i_rVideo.m_ImageHeight );
    std::memcpy( Header.m_Compression.data(), i_rCodec.m_pFourCC, Header.m_Compression.size() );
    SetBytes<KaxCodecPrivate>( o_rTrack, &Header, sizeof( Header ) );
  }
  if( i_rCodec.m_Place == EFourCCPlace::ColourSpace )
  {
    SetBytes<KaxVideoColourSpace>( libebml::GetChild<KaxTrackVideo>( o_rTrack ), i_rCodec.m_pFourCC, 4 );
  }
}

}

void FillVideoTrack( KaxTracks& io_rTracks, const KVZ::VideoFrameInfo& i_rVideo, const VVideoCodec& i_rCodec, uint32_t i_PeriodInNanoseconds )
{
  KaxTrackEntry& rTrack = AddTrack( io_rTracks, VideoTrackNumber, ETrackType::Video );
  // A duration of 0 is not allowed.
  if( i_PeriodInNanoseconds != 0 )
  {
    Set<KaxTrackDefaultDuration>( rTrack, i_PeriodInNanoseconds );
  }
  FillPicture( libebml::GetChild<KaxTrackVideo>( rTrack ), i_rVideo );
  FillCodec( rTrack, i_rVideo, i_rCodec );
}

void FillAudioTrack( KaxTracks& io_rTracks, const KVZ::AudioFrameInfo& i_rAudio, const VAudioCodec& i_rCodec )
{
  KaxTrackEntry& rTrack = AddTrack( io_rTracks, AudioTrackNumber, ETrackType::Audio );
  Set<KaxTrackFlagEnabled>( rTrack, 1u );
  Set<KaxTrackFlagDefault>( rTrack, 1u );
  Set<KaxTrackFlagForced>( rTrack, 1u );
  Set<KaxTrackMinCache>( rTrack, 100000u );
  Set<KaxMaxBlockAdditionID>( rTrack, 0u );
  Set<KaxCodecID>( rTrack, std::string( i_rCodec.m_pId ) );
  Set<KaxTrackLanguage>( rTrack, std::string( "eng" ) );
  auto& rSound = libebml::GetChild<KaxTrackAudio>( rTrack );
  Set<KaxAudioChannels>( rSound, i_rAudio.m_Channels );
  Set<KaxAudioSamplingFreq>( rSound, i_rAudio.m_SampleRate );
  Set<KaxAudioOutputSamplingFreq>( rSound, i_rAudio.m_SampleRate );
  Set<KaxAudioBitDepth>( rSound, i_rCodec.m_BitDepth );
}

}
