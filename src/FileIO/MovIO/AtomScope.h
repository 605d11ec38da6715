// One atom while it is written: its size is put in place when the scope is closed, so nobody computes a length by hand.
//
//   VAtomScope Tref( Out, "tref" );
//   return Tref.Close( WriteSync( Out ) && WriteTmcd( Out ) );
#pragma once

#include "FileIO/MovIO/MovPrimitiveWriter.h"

namespace MovIO
{

class VAtomScope
{
public:
  // Writes the size as 0, and the type: four characters that outlive the scope.
  VAtomScope( VMovPrimitiveWriter& io_rOut, const char* i_pType );
  VAtomScope( const VAtomScope& ) = delete;
  VAtomScope& operator=( const VAtomScope& ) = delete;

  // i_bContent says whether the content is there. False, with a line in the log, if it is not or if anything could not be written.
  bool Close( bool i_bContent = true );
  // The same for an atom whose size is laid down; another size is reported and left.
  bool CloseSized( uint32_t i_Size, bool i_bContent = true );

private:
  bool PatchSize( uint64_t i_Size );

  VMovPrimitiveWriter& m_rOut;
  const char* const m_pType;
  const uint64_t m_Start;
};

}
