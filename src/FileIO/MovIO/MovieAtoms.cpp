#include "FileIO/MovIO/MovieAtoms.h"

#include "FileIO/MovIO/AtomScope.h"
#include "FileIO/MovIO/TrackAtoms.h"

namespace MovIO
{

namespace
{

// Stays at this number although the timecode track has it.
constexpr uint32_t NextTrackId = 3;

bool WriteMvhd( VMovPrimitiveWriter& io_rOut, const VMovie& i_rMovie )
{
  VAtomScope Mvhd( io_rOut, "mvhd" );
  io_rOut.Version0();
  io_rOut.U32( 0 ).U32( 0 );   // creation and modification time
  io_rOut.U32( i_rMovie.m_Timescale ).U32( i_rMovie.m_Duration );
  io_rOut.U32( 0x10000 ).U16( 0x100 );   // rate, volume
  io_rOut.Zeros( 10 );
  WriteMatrix( io_rOut );
  io_rOut.Zeros( 24 );   // preview, poster, selection and current time
  io_rOut.U32( NextTrackId );
  return Mvhd.CloseSized( 108 );
}

}

bool WriteMoov( VMovPrimitiveWriter& io_rOut, const VMovie& i_rMovie )
{
  VAtomScope Moov( io_rOut, "moov" );
  return Moov.Close( WriteMvhd( io_rOut, i_rMovie ) && WriteVideoTrak( io_rOut, i_rMovie ) &&
    ( !i_rMovie.HasAudio() || WriteAudioTrak( io_rOut, i_rMovie ) ) && WriteTimecodeTrak( io_rOut, i_rMovie ) );
}

void WriteMatrix( VMovPrimitiveWriter& io_rOut )
{
  io_rOut.U32( 0x10000 ).U32( 0 ).U32( 0 );
  io_rOut.U32( 0 ).U32( 0x10000 ).U32( 0 );
  io_rOut.U32( 0 ).U32( 0 ).U32( 0x40000000 );
}

}
