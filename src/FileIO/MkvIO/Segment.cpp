#include "FileIO/MkvIO/Segment.h"

#include "FileIO/MkvIO/Cues.h"
#include "FileIO/MkvIO/ElementSetting.h"
#include "FileIO/MkvIO/Format.h"
#include "FileIO/MkvIO/SegmentInfo.h"
#include "StageCoreRuntime/GlobalLog.h"

#include <ebml/EbmlHead.h>
#include <ebml/EbmlSubHead.h>
#include <ebml/EbmlVoid.h>
#include <matroska/KaxCues.h>
#include <matroska/KaxSeekHead.h>
#include <matroska/KaxSegment.h>

#include <algorithm>

namespace MkvIO
{

using namespace libmatroska;

namespace
{

// As many bytes as the known one will take.
const VBytes UnknownSize = { 0x0F, 0xFF, 0xFF, 0xFF, 0xFF };
static_assert( SegmentSizeBytes == 5 );

void RenderHead( VMkvIOCallback& o_rFile )
{
  libebml::EbmlHead Head;
  Set<libebml::EDocType>( Head, std::string( "matroska" ) );
  Set<libebml::EDocTypeVersion>( Head, 1u );
  Set<libebml::EDocTypeReadVersion>( Head, 1u );
  Head.Render( o_rFile, true );
}

}

void VSegment::Begin( const VSegmentStart& i_rStart )
{
  m_Period = i_rStart.m_Period;
  RenderHead( m_rFile );
  BeginSegment();
  m_VoidPosition = m_rFile.getFilePointer();
  libebml::EbmlVoid Void;
  Void.SetSize( SeekHeadRoom );
  Void.Render( m_rFile );
  FillInfo( m_Info, i_rStart.m_pWritingApplication );
  RenderIndexed( m_Info );
  RenderIndexed( i_rStart.m_rTracks );
  RenderIndexed( i_rStart.m_rTags );
  m_End = m_rFile.getFilePointer();
}

// The library would mark an unknown size by zeros, which readers take for an empty segment.
void VSegment::BeginSegment()
{
  VBytes Head;
  AppendId( Head, EBML_ID( KaxSegment ) );
  Head.insert( Head.end(), UnknownSize.begin(), UnknownSize.end() );
  m_rFile.write( Head.data(), Head.size() );
  m_DataStart = m_rFile.getFilePointer();
}

void VSegment::RenderIndexed( libebml::EbmlMaster& io_rElement )
{
  if( io_rElement.ListSize() != 0 )
  {
    io_rElement.Render( m_rFile );
    m_SeekHead.Add( io_rElement, Relative( io_rElement.GetElementPosition() ) );
  }
}

bool VSegment::AddFrame( const KVZ::VBufferList& i_rVideo, const KVZ::VBufferList& i_rAudio )
{
  WriterSupport::VWatchedStream& rStream = m_rFile.Stream();
  if( rStream.HasFailed() )
  {
    return false;
  }
  const auto& rSpans = m_Cluster.Compose( { m_Clusters.Count() * m_Period, m_Period }, i_rVideo, i_rAudio );
  m_Clusters.Add( { Relative( m_End ), KVZ::GetTotalSize( i_rAudio ) != 0 } );
  if( !rStream.Seek( m_End ) || !rStream.Write( rSpans ) || !rStream.Tell( m_End ) )
  {
    m_Clusters.RemoveLast();
    return false;
  }
  return true;
}

bool VSegment::Finish()
{
  return m_rFile.Stream().Seek( m_End ) && AppendTables() && CoverRemains() && WriteAt( m_VoidPosition, m_SeekHead.FillPlace() ) && WriteSize();
}

bool VSegment::WriteAt( uint64_t i_Position, const VBytes& i_rBytes ) { return m_rFile.Stream().Seek( i_Position ) && Write( i_rBytes ); }

template<class TWriteTable>
bool VSegment::AppendTable( const libebml::EbmlId& i_rId, TWriteTable i_WriteTable )
{
  uint64_t Position = 0;
  if( !m_rFile.Stream().Tell( Position ) || !i_WriteTable( m_rFile.Stream() ) )
  {
    return false;
  }
  m_SeekHead.Add( i_rId, Relative( Position ) );
  return true;
}

bool VSegment::AppendTables()
{
  const size_t Taken = m_SeekHead.AddClusters( m_Clusters );
  const auto Cues = [&]( KVZ::IOutputStream& o_rStream ) { return WriteCues( o_rStream, m_Clusters, m_Period ); };
  if( m_Clusters.Count() != 0 && !AppendTable( EBML_ID( KaxCues ), Cues ) )
  {
    return false;
  }
  if( !RewriteInfo() )
  {
    return false;
  }
  const auto Secondary = [&]( KVZ::IOutputStream& o_rStream ) { return WriteSecondarySeekHead( o_rStream, m_Clusters, Taken ); };
  return Taken == m_Clusters.Count() || AppendTable( EBML_ID( KaxSeekHead ), Secondary );
}

// With the duration.
bool VSegment::RewriteInfo()
{
  SetDuration( m_Info, m_Clusters.Count() * m_Period );
  const uint64_t Position = m_rFile.getFilePointer();
  m_rFile.setFilePointer( static_cast<int64_t>( m_Info.GetElementPosition() ) );
  m_Info.Render( m_rFile );
  return m_rFile.Stream().Seek( Position );
}

// What a failed write has left behind the tables.
bool VSegment::CoverRemains()
{
  WriterSupport::VWatchedStream& rStream = m_rFile.Stream();
  uint64_t Position = 0;
  if( !rStream.Tell( Position ) )
  {
    return false;
  }
  if( Position == rStream.GetEnd() )
  {
    return true;
  }
  VBytes Head;
  AppendVoidHead( Head, std::max( rStream.GetEnd() - Position, SmallestVoid ) );
  return Write( Head );
}

bool VSegment::WriteSize()
{
  const uint64_t Size = Relative( m_rFile.Stream().GetEnd() );
  if( Size > LargestSegment )
  {
    KVZ_LOG( "MkvIO", KVZ::LogLevel::Information, "The file's %1% bytes are more than the %2% that its size field can hold: it stays marked unknown.",
      Size, LargestSegment );
    return true;
  }
  VBytes Field( SegmentSizeBytes );
  libebml::CodedValueLength( Size, SegmentSizeBytes, Field.data() );
  const uint64_t Position = m_DataStart - SegmentSizeBytes;
  if( WriteAt( Position, Field ) )
  {
    return true;
  }
  WriteAt( Position, UnknownSize );   // instead of half a size
  return false;
}

}
