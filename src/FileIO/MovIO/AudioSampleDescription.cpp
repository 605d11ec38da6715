#include "Core/VideoInterface/EnumTable.h"
#include "FileIO/MovIO/AtomScope.h"
#include "FileIO/MovIO/SampleDescriptions.h"
#include "StageCoreRuntime/GlobalLog.h"

namespace MovIO
{

namespace
{

using KVZ::IAudioSampleFormat;

constexpr uint16_t Version = 2;
constexpr uint32_t LpcmEntrySize = 72;
constexpr uint32_t SignedAndPacked = 12;

// The data reference stays 0 in both entries, unlike those of the other tracks.
void WriteEntryStart( VMovPrimitiveWriter& io_rOut )
{
  io_rOut.U32( 0 ).U16( 0 ).U16( 0 );
  io_rOut.U16( Version ).U16( 0 ).U32( 0 );
}

// The fields that older readers look for hold what version 2 lays down; the true ones follow.
bool WriteLpcm( VMovPrimitiveWriter& io_rOut, const VMovie& i_rMovie )
{
  VAtomScope Entry( io_rOut, "lpcm" );
  WriteEntryStart( io_rOut );
  io_rOut.U16( 3 ).U16( 16 ).U16( 0xFFFF ).U16( 0 ).Fixed16_16( 1.0 );
  io_rOut.U32( LpcmEntrySize ).Double( i_rMovie.m_AudioInfo.m_SampleRate ).U32( i_rMovie.m_AudioInfo.m_Channels );
  io_rOut.U32( 0x7F000000 ).U32( 8 * KVZ::GetBytesPerSample( i_rMovie.m_AudioInfo.m_SampleFormat ) );
  io_rOut.U32( SignedAndPacked ).U32( i_rMovie.BytesPerSampleFrame() ).U32( 1 );
  return Entry.CloseSized( LpcmEntrySize );
}

// Says version 2 and has none of that version's fields.
bool WriteRaw( VMovPrimitiveWriter& io_rOut, const VMovie& i_rMovie )
{
  VAtomScope Entry( io_rOut, "raw " );
  WriteEntryStart( io_rOut );
  io_rOut.U16( static_cast<uint16_t>( i_rMovie.m_AudioInfo.m_Channels ) );
  io_rOut.U16( static_cast<uint16_t>( 8 * KVZ::GetBytesPerSample( i_rMovie.m_AudioInfo.m_SampleFormat ) ) );
  io_rOut.U16( 0 ).U16( 0 ).Fixed16_16( i_rMovie.m_AudioInfo.m_SampleRate );
  return Entry.Close();
}

bool WriteEntry( VMovPrimitiveWriter& io_rOut, const VMovie& i_rMovie )
{
  switch( i_rMovie.m_AudioInfo.m_SampleFormat )
  {
    case IAudioSampleFormat::EInt16:
    case IAudioSampleFormat::EInt24:
    case IAudioSampleFormat::EInt32: return WriteLpcm( io_rOut, i_rMovie );
    case IAudioSampleFormat::EUInt8: return WriteRaw( io_rOut, i_rMovie );
    default:
      KVZ_LOG_ERROR( "MovIO", "Audio sample format %s unsupported.", KVZ::NameOrUnspecified( i_rMovie.m_AudioInfo.m_SampleFormat ) );
      return false;
  }
}

}

bool WriteAudioStsd( VMovPrimitiveWriter& io_rOut, const VMovie& i_rMovie )
{
  VAtomScope Stsd( io_rOut, "stsd" );
  io_rOut.Version0().U32( 1 );
  return Stsd.Close( WriteEntry( io_rOut, i_rMovie ) );
}

}
