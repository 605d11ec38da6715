#include "FileIO/MovIO/TrackAtoms.h"

#include "FileIO/MovIO/AtomScope.h"
#include "FileIO/MovIO/MediaAtoms.h"
#include "FileIO/MovIO/MovieAtoms.h"

namespace MovIO
{

namespace
{

// Of "tkhd".
enum EFlags : uint32_t
{
  Enabled = 1,
  InMovie = 2,
  InPreview = 4,
  InPoster = 8
};

struct VTrackHeader
{
  uint32_t m_Flags;
  uint32_t m_Id;
  uint32_t m_Duration;   // in the movie's timescale
  double m_Volume;
  uint32_t m_Width;   // pixels
  uint32_t m_Height;
};

bool WriteTkhd( VMovPrimitiveWriter& io_rOut, const VTrackHeader& i_rHeader )
{
  VAtomScope Tkhd( io_rOut, "tkhd" );
  io_rOut.Version0( i_rHeader.m_Flags );
  io_rOut.U32( 0 ).U32( 0 );   // creation and modification time
  io_rOut.U32( i_rHeader.m_Id ).U32( 0 ).U32( i_rHeader.m_Duration );
  io_rOut.U32( 0 ).U32( 0 );
  io_rOut.U16( 0 ).U16( 0 );   // layer, alternate group
  io_rOut.Fixed8_8( i_rHeader.m_Volume ).U16( 0 );
  WriteMatrix( io_rOut );
  io_rOut.U32( i_rHeader.m_Width << 16 ).U32( i_rHeader.m_Height << 16 );
  return Tkhd.CloseSized( 92 );
}

bool WriteAperture( VMovPrimitiveWriter& io_rOut, const char* i_pType, const KVZ::VideoFrameInfo& i_rInfo )
{
  VAtomScope Aperture( io_rOut, i_pType );
  io_rOut.Version0().U32( i_rInfo.m_ImageWidth << 16 ).U32( i_rInfo.m_ImageHeight << 16 );
  return Aperture.CloseSized( 20 );
}

bool WriteTapt( VMovPrimitiveWriter& io_rOut, const KVZ::VideoFrameInfo& i_rInfo )
{
  VAtomScope Tapt( io_rOut, "tapt" );
  return Tapt.Close(
    WriteAperture( io_rOut, "clef", i_rInfo ) && WriteAperture( io_rOut, "prof", i_rInfo ) && WriteAperture( io_rOut, "enof", i_rInfo ) );
}

bool WriteElst( VMovPrimitiveWriter& io_rOut, uint32_t i_Duration, uint32_t i_MediaTime )
{
  VAtomScope Elst( io_rOut, "elst" );
  io_rOut.Version0().U32( 1 );
  io_rOut.U32( i_Duration ).U32( i_MediaTime ).U32( 0x10000 );   // rate 1
  return Elst.Close();
}

bool WriteEdts( VMovPrimitiveWriter& io_rOut, uint32_t i_Duration, uint32_t i_MediaTime )
{
  VAtomScope Edts( io_rOut, "edts" );
  return Edts.Close( WriteElst( io_rOut, i_Duration, i_MediaTime ) );
}

bool WriteSync( VMovPrimitiveWriter& io_rOut, const VMovie& i_rMovie )
{
  VAtomScope Sync( io_rOut, "sync" );
  io_rOut.U32( i_rMovie.m_Audio.m_Id );
  return Sync.Close();
}

bool WriteTmcdReference( VMovPrimitiveWriter& io_rOut, const VMovie& i_rMovie )
{
  VAtomScope Tmcd( io_rOut, "tmcd" );
  io_rOut.U32( i_rMovie.m_TimecodeTrack.m_Id );
  return Tmcd.CloseSized( 12 );
}

// Names the audio track also where there is none.
bool WriteTref( VMovPrimitiveWriter& io_rOut, const VMovie& i_rMovie )
{
  VAtomScope Tref( io_rOut, "tref" );
  return Tref.Close( WriteSync( io_rOut, i_rMovie ) && WriteTmcdReference( io_rOut, i_rMovie ) );
}

}

bool WriteVideoTrak( VMovPrimitiveWriter& io_rOut, const VMovie& i_rMovie )
{
  VAtomScope Trak( io_rOut, "trak" );
  const VTrack& rTrack = i_rMovie.m_Video;
  const KVZ::VideoFrameInfo& rInfo = i_rMovie.m_VideoInfo;
  constexpr uint32_t Flags = Enabled | InMovie | InPreview | InPoster;
  return Trak.Close( WriteTkhd( io_rOut, { Flags, rTrack.m_Id, rTrack.m_Duration, 0.0, rInfo.m_ImageWidth, rInfo.m_ImageHeight } ) &&
    WriteTapt( io_rOut, rInfo ) && WriteEdts( io_rOut, rTrack.m_Duration, i_rMovie.FirstShown() ) &&
    ( !i_rMovie.IsMOV() || WriteTref( io_rOut, i_rMovie ) ) && WriteVideoMdia( io_rOut, i_rMovie ) );
}

bool WriteAudioTrak( VMovPrimitiveWriter& io_rOut, const VMovie& i_rMovie )
{
  VAtomScope Trak( io_rOut, "trak" );
  const VTrack& rTrack = i_rMovie.m_Audio;
  return Trak.Close( WriteTkhd( io_rOut, { Enabled | InMovie, rTrack.m_Id, rTrack.m_Duration, 1.0, 0, 0 } ) &&
    WriteEdts( io_rOut, rTrack.m_Duration, 0 ) && WriteAudioMdia( io_rOut, i_rMovie ) );
}

bool WriteTimecodeTrak( VMovPrimitiveWriter& io_rOut, const VMovie& i_rMovie )
{
  VAtomScope Trak( io_rOut, "trak" );
  const VTrack& rTrack = i_rMovie.m_TimecodeTrack;
  const KVZ::VideoFrameInfo& rInfo = i_rMovie.m_VideoInfo;
  constexpr uint32_t Flags = Enabled | InMovie | InPreview | InPoster;
  const uint32_t Duration = rTrack.m_Duration + i_rMovie.m_TimecodeRemainder;
  return Trak.Close( WriteTkhd( io_rOut, { Flags, rTrack.m_Id, Duration, 0.0, rInfo.m_ImageWidth, rInfo.m_ImageHeight } ) &&
    WriteEdts( io_rOut, rTrack.m_Duration, i_rMovie.m_TimecodeRemainder ) && WriteTimecodeMdia( io_rOut, i_rMovie ) );
}

}
