#include "FileIO/RapidAVI/Headers.h"

namespace RapidAVI
{

namespace
{

constexpr uint32_t HasIndexAndTrustedChunkIds = 0x810;
constexpr uint32_t SuperIndexSize = sizeof( VSuperIndexHeader ) + SuperIndexEntries * sizeof( VSuperIndexEntry );
static_assert( SuperIndexSize == 0x4018 );

// A chunk that is one record. The position of its content goes to o_rPosition.
template<class TRecord>
bool WriteRecord( VChunkWriter& io_rOut, VFourCC i_Id, const TRecord& i_rRecord, uint64_t& o_rPosition )
{
  VChunkScope Chunk( io_rOut, i_Id, sizeof( i_rRecord ) );
  return io_rOut.Tell( o_rPosition ) && io_rOut.Write( &i_rRecord, sizeof( i_rRecord ) ) && Chunk.Close();
}

bool WriteMainHeader( VChunkWriter& io_rOut, const VFileDescription& i_rFile, VOpenFields& o_rFields )
{
  VMainHeader Header;
  Header.m_MicrosecondsPerFrame = static_cast<uint32_t>( GetMicrosecondsPerFrame( i_rFile ) );
  Header.m_MaxBytesPerSecond = GetMaxBytesPerSecond( i_rFile );
  Header.m_Flags = HasIndexAndTrustedChunkIds;
  Header.m_Streams = i_rFile.m_Audio.HasAudio() ? 2 : 1;
  Header.m_Width = i_rFile.m_Video.m_ImageWidth;
  Header.m_Height = i_rFile.m_Video.m_ImageHeight;
  uint64_t Position = 0;
  const bool bWritten = WriteRecord( io_rOut, FourCC( "avih" ), Header, Position );
  o_rFields.m_TotalFrames = Position + offsetof( VMainHeader, m_TotalFrames );
  return bWritten;
}

bool WriteStreamHeader( VChunkWriter& io_rOut, const VStreamHeader& i_rHeader, uint64_t& o_rLengthPosition )
{
  uint64_t Position = 0;
  const bool bWritten = WriteRecord( io_rOut, FourCC( "strh" ), i_rHeader, Position );
  o_rLengthPosition = Position + offsetof( VStreamHeader, m_Length );
  return bWritten;
}

bool WriteSuperIndexRoom( VChunkWriter& io_rOut, VFourCC i_ChunkId, uint64_t& o_rPosition )
{
  VSuperIndexHeader Header;
  Header.m_ChunkId = i_ChunkId;
  VChunkScope Chunk( io_rOut, FourCC( "indx" ), SuperIndexSize );
  return io_rOut.Tell( o_rPosition ) && io_rOut.Write( &Header, sizeof( Header ) ) && io_rOut.Reserve( SuperIndexSize - sizeof( Header ) ) &&
    Chunk.Close();
}

bool WriteBitmapHeader( VChunkWriter& io_rOut, const VFileDescription& i_rFile )
{
  const WriterSupport::VBitmapHeader Header = MakeBitmapHeader( i_rFile );
  const boost::optional<VPalette> Palette = MakePalette( i_rFile );
  VChunkScope Chunk( io_rOut, FourCC( "strf" ), static_cast<uint32_t>( sizeof( Header ) + ( Palette ? sizeof( *Palette ) : 0 ) ) );
  return io_rOut.Write( &Header, sizeof( Header ) ) && ( !Palette || io_rOut.Write( Palette->data(), sizeof( *Palette ) ) ) && Chunk.Close();
}

bool WriteVideoStream( VChunkWriter& io_rOut, const VFileDescription& i_rFile, VOpenFields& o_rFields )
{
  VChunkScope Stream = VChunkScope::List( io_rOut, FourCC( "strl" ) );
  return WriteStreamHeader( io_rOut, MakeVideoStreamHeader( i_rFile ), o_rFields.m_VideoLength ) && WriteBitmapHeader( io_rOut, i_rFile ) &&
    WriteSuperIndexRoom( io_rOut, GetVideoChunkId( i_rFile ), o_rFields.m_VideoSuperIndex ) && Stream.Close();
}

bool WriteAudioStream( VChunkWriter& io_rOut, const VFileDescription& i_rFile, VOpenFields& o_rFields )
{
  VChunkScope Stream = VChunkScope::List( io_rOut, FourCC( "strl" ) );
  uint64_t Position = 0;
  return WriteStreamHeader( io_rOut, MakeAudioStreamHeader( i_rFile ), o_rFields.m_AudioLength ) &&
    WriteRecord( io_rOut, FourCC( "strf" ), MakeWaveFormat( i_rFile.m_Audio ), Position ) &&
    WriteSuperIndexRoom( io_rOut, AudioChunkId, o_rFields.m_AudioSuperIndex ) && Stream.Close();
}

bool WriteExtendedHeader( VChunkWriter& io_rOut, VOpenFields& o_rFields )
{
  VChunkScope List = VChunkScope::List( io_rOut, FourCC( "odml" ) );
  VChunkScope Chunk( io_rOut, FourCC( "dmlh" ), ExtendedHeaderSize );
  return io_rOut.Tell( o_rFields.m_ExtendedTotalFrames ) && io_rOut.Reserve( ExtendedHeaderSize ) && Chunk.Close() && List.Close();
}

bool FillNumber( VChunkWriter& io_rOut, uint64_t i_Position, uint32_t i_Number )
{
  return io_rOut.Seek( i_Position ) && io_rOut.Write( &i_Number, sizeof( i_Number ) );
}

}

bool WriteHeaderList( VChunkWriter& io_rOut, const VFileDescription& i_rFile, VOpenFields& o_rFields )
{
  VChunkScope Headers = VChunkScope::List( io_rOut, FourCC( "hdrl" ) );
  return WriteMainHeader( io_rOut, i_rFile, o_rFields ) && WriteVideoStream( io_rOut, i_rFile, o_rFields ) &&
    ( !i_rFile.m_Audio.HasAudio() || WriteAudioStream( io_rOut, i_rFile, o_rFields ) ) && WriteExtendedHeader( io_rOut, o_rFields ) &&
    Headers.Close();
}

bool FillOpenFields( VChunkWriter& io_rOut, const VOpenFields& i_rFields, const VIndex& i_rIndex, uint32_t i_AudioSampleFrames )
{
  const auto Frames = static_cast<uint32_t>( i_rIndex.CountFrames() );
  const bool bAudio = i_rIndex.CountStreams() > 1;
  return FillNumber( io_rOut, i_rFields.m_VideoLength, Frames ) &&
    ( !bAudio || FillNumber( io_rOut, i_rFields.m_AudioLength, i_AudioSampleFrames ) ) &&
    i_rIndex.WriteSuperIndex( io_rOut, i_rFields.m_VideoSuperIndex, VideoStream ) &&
    ( !bAudio || i_rIndex.WriteSuperIndex( io_rOut, i_rFields.m_AudioSuperIndex, AudioStream ) ) &&
    FillNumber( io_rOut, i_rFields.m_TotalFrames, Frames ) && FillNumber( io_rOut, i_rFields.m_ExtendedTotalFrames, Frames );
}

}
