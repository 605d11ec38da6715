#include "FileIO/MkvIO/SeekHead.h"

#include "FileIO/MkvIO/Format.h"
#include "FileIO/MkvIO/TableElement.h"

#include <ebml/EbmlVoid.h>
#include <matroska/KaxCluster.h>
#include <matroska/KaxSeekHead.h>
#include <matroska/KaxSemantic.h>

#include <stdexcept>

namespace MkvIO
{

using namespace libmatroska;

namespace
{

void AppendSeek( VBytes& o_rBytes, const libebml::EbmlId& i_rId, uint64_t i_Position )
{
  const uint64_t IdBytes = i_rId.GetLength();
  const uint64_t Id = HeadSize( EBML_ID( KaxSeekID ), IdBytes ) + IdBytes;
  AppendHead( o_rBytes, EBML_ID( KaxSeek ), Id + NumberSize( EBML_ID( KaxSeekPosition ), i_Position ) );
  AppendHead( o_rBytes, EBML_ID( KaxSeekID ), IdBytes );
  AppendId( o_rBytes, i_rId );
  AppendNumber( o_rBytes, EBML_ID( KaxSeekPosition ), i_Position );
}

}

void VMainSeekHead::Add( const libebml::EbmlId& i_rId, uint64_t i_Position ) { AppendSeek( m_Data, i_rId, i_Position ); }

size_t VMainSeekHead::AddClusters( const VClusterTable& i_rClusters )
{
  size_t Frame = 0;
  while( Frame < i_rClusters.Count() && m_Data.size() + SeekHeadReserve < SeekHeadRoom )
  {
    Add( EBML_ID( KaxCluster ), i_rClusters.At( Frame ).m_Position );
    ++Frame;
  }
  return Frame;
}

VBytes VMainSeekHead::FillPlace() const
{
  const size_t Place = HeadSize( EBML_ID( libebml::EbmlVoid ), SeekHeadRoom ) + SeekHeadRoom;
  VBytes Bytes;
  AppendHead( Bytes, EBML_ID( KaxSeekHead ), m_Data.size() );
  Bytes.insert( Bytes.end(), m_Data.begin(), m_Data.end() );
  if( Bytes.size() + SmallestVoid > Place )
  {
    throw std::logic_error( "the seek head has outgrown its place" );
  }
  AppendVoidHead( Bytes, Place - Bytes.size() );
  Bytes.resize( Place );
  return Bytes;
}

bool WriteSecondarySeekHead( KVZ::IOutputStream& o_rStream, const VClusterTable& i_rClusters, size_t i_First )
{
  return WriteTable( o_rStream, EBML_ID( KaxSeekHead ), i_First, i_rClusters.Count(),
    [&]( VBytes& o_rBytes, size_t i_Frame ) { AppendSeek( o_rBytes, EBML_ID( KaxCluster ), i_rClusters.At( i_Frame ).m_Position ); } );
}

}
