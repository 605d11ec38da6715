#include "Core/VideoInterface/EnumTable.h"
#include "FileIO/MovIO/AtomScope.h"
#include "FileIO/MovIO/SampleDescriptions.h"
#include "StageCoreRuntime/GlobalLog.h"

namespace MovIO
{

namespace
{

using KVZ::ITimecodeStandard;

constexpr uint32_t DropFrame = 1;

bool WriteEntry( VMovPrimitiveWriter& io_rOut, const VMovie& i_rMovie )
{
  VAtomScope Entry( io_rOut, "tmcd" );
  const auto Standard = static_cast<ITimecodeStandard::Enum>( i_rMovie.m_Timecode.m_Standard );
  const KVZ::VTimecodeStandardRow* pRow = KVZ::FindTimecodeStandard( Standard );
  if( !pRow )
  {
    KVZ_LOG_ERROR( "MovIO", "Unknown timecode standard '%s'", KVZ::NameOrUnspecified( Standard ) );
    return Entry.Close( false );
  }
  io_rOut.Zeros( 6 ).U16( 1 ).U32( 0 );   // data reference
  io_rOut.U32( Standard == ITimecodeStandard::ETimecode30Drop ? DropFrame : 0 );
  io_rOut.U32( i_rMovie.m_Timescale ).U32( i_rMovie.m_TimecodeTrack.m_SamplePeriod ).U8( pRow->m_NominalFrames ).U8( 0 );
  io_rOut.Zeros( i_rMovie.IsMOV() ? 2 : 0 );
  return Entry.Close();
}

}

bool WriteTimecodeStsd( VMovPrimitiveWriter& io_rOut, const VMovie& i_rMovie )
{
  VAtomScope Stsd( io_rOut, "stsd" );
  io_rOut.Version0().U32( 1 );
  return Stsd.Close( WriteEntry( io_rOut, i_rMovie ) );
}

}
