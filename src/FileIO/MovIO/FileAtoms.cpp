#include "FileIO/MovIO/FileAtoms.h"

#include "FileIO/MovIO/AtomScope.h"
#include "FileIO/WriterSupport/AttributeBlock.h"

namespace MovIO
{

namespace
{

constexpr uint64_t SizeOffset = 8;   // of the 64-bit size, in an atom that has one
constexpr uint64_t ShortHeader = 8;
constexpr uint64_t LongHeader = 16;

}

bool WriteFtyp( VMovPrimitiveWriter& io_rOut, const VMovie& i_rMovie )
{
  VAtomScope Ftyp( io_rOut, "ftyp" );
  if( i_rMovie.IsMOV() )
  {
    io_rOut.FourCC( "qt  " ).U32( 0x20140211 ).FourCC( "qt  " ).Zeros( 12 );
  }
  else
  {
    io_rOut.FourCC( "mp42" ).U32( 0 ).FourCC( "mp42" ).FourCC( "isom" ).FourCC( "avc1" );
  }
  return Ftyp.Close();
}

bool WriteMdatHeader( VMovPrimitiveWriter& io_rOut ) { return io_rOut.U32( 1 ).FourCC( "mdat" ).U64( 0 ).IsOk(); }

bool PatchMdatSize( VMovPrimitiveWriter& io_rOut, const VMovie& i_rMovie, uint64_t i_End )
{
  return io_rOut.Seek( i_rMovie.m_MdatPosition + SizeOffset ) && io_rOut.U64( i_End - i_rMovie.m_MdatPosition ).Seek( i_End );
}

bool WriteTmsl( VMovPrimitiveWriter& io_rOut, const VMovie& i_rMovie )
{
  VAtomScope Tmsl( io_rOut, "TMSL" );
  return Tmsl.Close(
    WriterSupport::WriteAttributeBlock( io_rOut, i_rMovie.m_Internal ) && WriterSupport::WriteAttributeBlock( io_rOut, i_rMovie.m_External ) );
}

bool WriteFree( VMovPrimitiveWriter& io_rOut, uint64_t i_End )
{
  const uint64_t Start = io_rOut.Tell();
  if( i_End >= Start + LongHeader )
  {
    io_rOut.U32( 1 ).FourCC( "free" ).U64( i_End - Start );
  }
  else if( i_End >= Start + ShortHeader )
  {
    io_rOut.U32( static_cast<uint32_t>( i_End - Start ) ).FourCC( "free" );
  }
  return io_rOut.IsOk();
}

}
