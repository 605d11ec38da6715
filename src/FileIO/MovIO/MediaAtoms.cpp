#include "FileIO/MovIO/MediaAtoms.h"

#include "FileIO/MovIO/AtomScope.h"
#include "FileIO/MovIO/SampleTableAtoms.h"

namespace MovIO
{

namespace
{

constexpr uint16_t UnspecifiedLanguage = 0x7FFF;
constexpr uint16_t DitherCopy = 0x40;
constexpr uint16_t HalfIntensity = 0x8000;

bool WriteMdhd( VMovPrimitiveWriter& io_rOut, const VTrack& i_rTrack )
{
  VAtomScope Mdhd( io_rOut, "mdhd" );
  io_rOut.Version0();
  io_rOut.U32( 0 ).U32( 0 );   // creation and modification time
  io_rOut.U32( i_rTrack.m_Timescale ).U32( i_rTrack.m_MediaDuration );
  io_rOut.U16( UnspecifiedLanguage ).U16( 0 );   // quality
  return Mdhd.CloseSized( 32 );
}

struct VHandler
{
  const char* m_pType;
  const char* m_pSubtype;
  bool m_bVendor;   // maker, flags and mask instead of zeros
  const char* m_pName;
  bool m_bTrailingZero;
};

constexpr VHandler VideoMediaHandler = { "mhlr", "vide", true, "Apple Video Media Handler", true };
constexpr VHandler AudioMediaHandler = { "mhlr", "soun", false, "SoundHandler", false };
constexpr VHandler TimecodeMediaHandler = { "mhlr", "tmcd", false, "TimeCodeHandler", true };
constexpr VHandler DataHandler = { "dhlr", "url ", false, "DataHandler", true };
constexpr VHandler AudioDataHandler = { "dhlr", "url ", false, "DataHandler", false };

bool WriteHdlr( VMovPrimitiveWriter& io_rOut, const VHandler& i_rHandler )
{
  VAtomScope Hdlr( io_rOut, "hdlr" );
  io_rOut.Version0().FourCC( i_rHandler.m_pType ).FourCC( i_rHandler.m_pSubtype );
  if( i_rHandler.m_bVendor )
  {
    io_rOut.FourCC( "appl" ).U32( 0x10000000 ).U32( 0x1023F );
  }
  else
  {
    io_rOut.Zeros( 12 );
  }
  io_rOut.PascalString( i_rHandler.m_pName ).Zeros( i_rHandler.m_bTrailingZero ? 1 : 0 );
  return Hdlr.Close();
}

void WriteGrey( VMovPrimitiveWriter& io_rOut ) { io_rOut.U16( HalfIntensity ).U16( HalfIntensity ).U16( HalfIntensity ); }

bool WriteVmhd( VMovPrimitiveWriter& io_rOut )
{
  VAtomScope Vmhd( io_rOut, "vmhd" );
  io_rOut.Version0( 1 ).U16( 0 );
  WriteGrey( io_rOut );
  return Vmhd.CloseSized( 20 );
}

bool WriteSmhd( VMovPrimitiveWriter& io_rOut )
{
  VAtomScope Smhd( io_rOut, "smhd" );
  io_rOut.Version0().U16( 0 ).U16( 0 );   // balance
  return Smhd.CloseSized( 16 );
}

bool WriteGmin( VMovPrimitiveWriter& io_rOut )
{
  VAtomScope Gmin( io_rOut, "gmin" );
  io_rOut.Version0().U16( DitherCopy );
  WriteGrey( io_rOut );
  io_rOut.U16( 0 ).U16( 0 );   // balance
  return Gmin.Close();
}

bool WriteTcmi( VMovPrimitiveWriter& io_rOut )
{
  VAtomScope Tcmi( io_rOut, "tcmi" );
  io_rOut.Version0();
  io_rOut.U16( 0 ).U16( 0 ).U16( 12 ).U16( 0 );        // font, face, size
  io_rOut.U16( 0 ).U16( 0 ).U16( 0 );                  // text: black
  io_rOut.U16( 0xFFFF ).U16( 0xFFFF ).U16( 0xFFFF );   // background: white
  io_rOut.PascalString( "Lucida Grande" );
  return Tcmi.Close();
}

bool WriteTimecodeInformation( VMovPrimitiveWriter& io_rOut )
{
  VAtomScope Tmcd( io_rOut, "tmcd" );
  return Tmcd.Close( WriteTcmi( io_rOut ) );
}

bool WriteGmhd( VMovPrimitiveWriter& io_rOut )
{
  VAtomScope Gmhd( io_rOut, "gmhd" );
  return Gmhd.Close( WriteGmin( io_rOut ) && WriteTimecodeInformation( io_rOut ) );
}

bool WriteNmhd( VMovPrimitiveWriter& io_rOut )
{
  VAtomScope Nmhd( io_rOut, "nmhd" );
  io_rOut.Version0();
  return Nmhd.Close();
}

// One reference, to this file itself.
bool WriteDref( VMovPrimitiveWriter& io_rOut )
{
  VAtomScope Dref( io_rOut, "dref" );
  io_rOut.Version0().U32( 1 );
  io_rOut.U32( 12 ).FourCC( "url " ).Version0( 1 );
  return Dref.Close();
}

bool WriteDinf( VMovPrimitiveWriter& io_rOut )
{
  VAtomScope Dinf( io_rOut, "dinf" );
  return Dinf.Close( WriteDref( io_rOut ) );
}

bool WriteVideoMinf( VMovPrimitiveWriter& io_rOut, const VMovie& i_rMovie )
{
  VAtomScope Minf( io_rOut, "minf" );
  return Minf.Close( WriteVmhd( io_rOut ) && WriteHdlr( io_rOut, DataHandler ) && WriteDinf( io_rOut ) && WriteVideoStbl( io_rOut, i_rMovie ) );
}

bool WriteAudioMinf( VMovPrimitiveWriter& io_rOut, const VMovie& i_rMovie )
{
  VAtomScope Minf( io_rOut, "minf" );
  return Minf.Close( WriteSmhd( io_rOut ) && WriteHdlr( io_rOut, AudioDataHandler ) && WriteDinf( io_rOut ) && WriteAudioStbl( io_rOut, i_rMovie ) );
}

bool WriteTimecodeMinf( VMovPrimitiveWriter& io_rOut, const VMovie& i_rMovie )
{
  VAtomScope Minf( io_rOut, "minf" );
  return Minf.Close( WriteGmhd( io_rOut ) && WriteNmhd( io_rOut ) && WriteHdlr( io_rOut, DataHandler ) && WriteDinf( io_rOut ) &&
    WriteTimecodeStbl( io_rOut, i_rMovie ) );
}

}

bool WriteVideoMdia( VMovPrimitiveWriter& io_rOut, const VMovie& i_rMovie )
{
  VAtomScope Mdia( io_rOut, "mdia" );
  return Mdia.Close( WriteMdhd( io_rOut, i_rMovie.m_Video ) && WriteHdlr( io_rOut, VideoMediaHandler ) && WriteVideoMinf( io_rOut, i_rMovie ) );
}

bool WriteAudioMdia( VMovPrimitiveWriter& io_rOut, const VMovie& i_rMovie )
{
  VAtomScope Mdia( io_rOut, "mdia" );
  return Mdia.Close( WriteMdhd( io_rOut, i_rMovie.m_Audio ) && WriteHdlr( io_rOut, AudioMediaHandler ) && WriteAudioMinf( io_rOut, i_rMovie ) );
}

bool WriteTimecodeMdia( VMovPrimitiveWriter& io_rOut, const VMovie& i_rMovie )
{
  VAtomScope Mdia( io_rOut, "mdia" );
  return Mdia.Close(
    WriteMdhd( io_rOut, i_rMovie.m_TimecodeTrack ) && WriteHdlr( io_rOut, TimecodeMediaHandler ) && WriteTimecodeMinf( io_rOut, i_rMovie ) );
}

}
