#include "FileIO/MovIO/SampleTableAtoms.h"

#include "FileIO/MovIO/AtomScope.h"
#include "FileIO/MovIO/SampleDescriptions.h"

#include <algorithm>

namespace MovIO
{

namespace
{

// The writer keeps the number of frames within 32 bits.
uint32_t CountFrames( const VMovie& i_rMovie ) { return static_cast<uint32_t>( i_rMovie.m_Frames.size() ); }

// All samples last the same time.
bool WriteStts( VMovPrimitiveWriter& io_rOut, uint32_t i_Count, uint32_t i_Delta )
{
  VAtomScope Stts( io_rOut, "stts" );
  io_rOut.Version0().U32( 1 );
  io_rOut.U32( i_Count ).U32( i_Delta );
  return Stts.Close();
}

bool WriteStss( VMovPrimitiveWriter& io_rOut, const VMovie& i_rMovie )
{
  const auto IsKeyFrame = []( const VFrameEntry& i_rFrame ) { return i_rFrame.m_FrameType == 'I'; };
  const auto KeyFrames = std::count_if( i_rMovie.m_Frames.begin(), i_rMovie.m_Frames.end(), IsKeyFrame );
  VAtomScope Stss( io_rOut, "stss" );
  io_rOut.Version0().U32( static_cast<uint32_t>( KeyFrames ) );
  uint32_t Number = 0;
  for( const VFrameEntry& rFrame : i_rMovie.m_Frames )
  {
    ++Number;
    if( IsKeyFrame( rFrame ) )
    {
      io_rOut.U32( Number );
    }
  }
  return Stss.Close();
}

bool WriteCtts( VMovPrimitiveWriter& io_rOut, const VMovie& i_rMovie )
{
  VAtomScope Ctts( io_rOut, "ctts" );
  io_rOut.Version0().U32( CountFrames( i_rMovie ) );
  for( const VFrameEntry& rFrame : i_rMovie.m_Frames )
  {
    io_rOut.U32( 1 ).U32( rFrame.m_FrameType == 'B' ? 0 : CompositionFrames * i_rMovie.m_Video.m_SamplePeriod );
  }
  return Ctts.Close();
}

// One sample a chunk, all of the one description.
bool WriteSingleSampleStsc( VMovPrimitiveWriter& io_rOut )
{
  VAtomScope Stsc( io_rOut, "stsc" );
  io_rOut.Version0().U32( 1 );
  io_rOut.U32( 1 ).U32( 1 ).U32( 1 );
  return Stsc.Close();
}

bool WriteAudioStsc( VMovPrimitiveWriter& io_rOut, const VMovie& i_rMovie )
{
  VAtomScope Stsc( io_rOut, "stsc" );
  io_rOut.Version0().U32( i_rMovie.m_Audio.m_ChunkCount );
  uint32_t Number = 0;
  for( const VFrameEntry& rFrame : i_rMovie.m_Frames )
  {
    if( rFrame.m_AudioSamples != 0 )
    {
      io_rOut.U32( ++Number ).U32( rFrame.m_AudioSamples ).U32( 1 );
    }
  }
  return Stsc.Close();
}

// Uncompressed images all have the size of the first.
bool WriteVideoStsz( VMovPrimitiveWriter& io_rOut, const VMovie& i_rMovie )
{
  const bool bOneSize = i_rMovie.m_VideoPayload == KVZ::IVideoPayload::EUncompressed;
  VAtomScope Stsz( io_rOut, "stsz" );
  io_rOut.Version0().U32( bOneSize && !i_rMovie.m_Frames.empty() ? i_rMovie.m_Frames.front().m_Size : 0 ).U32( CountFrames( i_rMovie ) );
  if( !bOneSize )
  {
    for( const VFrameEntry& rFrame : i_rMovie.m_Frames )
    {
      io_rOut.U32( rFrame.m_Size );
    }
  }
  return Stsz.Close();
}

bool WriteAudioStsz( VMovPrimitiveWriter& io_rOut, const VMovie& i_rMovie )
{
  VAtomScope Stsz( io_rOut, "stsz" );
  io_rOut.Version0().U32( i_rMovie.BytesPerSampleFrame() ).U32( i_rMovie.m_Audio.m_SampleCount );
  return Stsz.Close();
}

bool WriteTimecodeStsz( VMovPrimitiveWriter& io_rOut )
{
  VAtomScope Stsz( io_rOut, "stsz" );
  io_rOut.Version0().U32( 4 ).U32( 1 );
  return Stsz.CloseSized( 20 );
}

// Chunk offsets are 64 bits wide whatever the size of the file.
bool WriteVideoCo64( VMovPrimitiveWriter& io_rOut, const VMovie& i_rMovie )
{
  VAtomScope Co64( io_rOut, "co64" );
  io_rOut.Version0().U32( CountFrames( i_rMovie ) );
  for( const VFrameEntry& rFrame : i_rMovie.m_Frames )
  {
    io_rOut.U64( rFrame.m_Position );
  }
  return Co64.Close();
}

bool WriteAudioCo64( VMovPrimitiveWriter& io_rOut, const VMovie& i_rMovie )
{
  VAtomScope Co64( io_rOut, "co64" );
  io_rOut.Version0().U32( i_rMovie.m_Audio.m_ChunkCount );
  for( const VFrameEntry& rFrame : i_rMovie.m_Frames )
  {
    if( rFrame.m_AudioSamples != 0 )
    {
      io_rOut.U64( rFrame.m_Position + rFrame.m_Size );
    }
  }
  return Co64.Close();
}

bool WriteTimecodeCo64( VMovPrimitiveWriter& io_rOut, const VMovie& i_rMovie )
{
  VAtomScope Co64( io_rOut, "co64" );
  io_rOut.Version0().U32( 1 );
  io_rOut.U64( i_rMovie.m_TimecodePosition );
  return Co64.Close();
}

}

bool WriteVideoStbl( VMovPrimitiveWriter& io_rOut, const VMovie& i_rMovie )
{
  const VTrack& rTrack = i_rMovie.m_Video;
  VAtomScope Stbl( io_rOut, "stbl" );
  return Stbl.Close( WriteVideoStsd( io_rOut, i_rMovie ) && WriteStts( io_rOut, CountFrames( i_rMovie ), rTrack.m_SamplePeriod ) &&
    ( !i_rMovie.IsH264() || ( WriteStss( io_rOut, i_rMovie ) && WriteCtts( io_rOut, i_rMovie ) ) ) && WriteSingleSampleStsc( io_rOut ) &&
    WriteVideoStsz( io_rOut, i_rMovie ) && WriteVideoCo64( io_rOut, i_rMovie ) );
}

bool WriteAudioStbl( VMovPrimitiveWriter& io_rOut, const VMovie& i_rMovie )
{
  const VTrack& rTrack = i_rMovie.m_Audio;
  VAtomScope Stbl( io_rOut, "stbl" );
  return Stbl.Close( WriteAudioStsd( io_rOut, i_rMovie ) && WriteStts( io_rOut, rTrack.m_SampleCount, rTrack.m_SamplePeriod ) &&
    WriteAudioStsc( io_rOut, i_rMovie ) && WriteAudioStsz( io_rOut, i_rMovie ) && WriteAudioCo64( io_rOut, i_rMovie ) );
}

bool WriteTimecodeStbl( VMovPrimitiveWriter& io_rOut, const VMovie& i_rMovie )
{
  VAtomScope Stbl( io_rOut, "stbl" );
  return Stbl.Close( WriteTimecodeStsd( io_rOut, i_rMovie ) && WriteStts( io_rOut, 1, i_rMovie.m_TimecodeRemainder + i_rMovie.m_Video.m_Duration ) &&
    WriteSingleSampleStsc( io_rOut ) && WriteTimecodeStsz( io_rOut ) && WriteTimecodeCo64( io_rOut, i_rMovie ) );
}

}
