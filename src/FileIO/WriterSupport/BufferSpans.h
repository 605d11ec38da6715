// The memory of buffers, in the form in which streams write it.
#pragma once

#include "Core/VideoInterface/Streams.h"

#include <vector>

namespace WriterSupport
{

// A span for each buffer that is not empty, valid while the buffers live.
inline void AppendSpans( std::vector<KVZ::IOutputStream::VSpan>& o_rSpans, const KVZ::VBufferList& i_rBuffers )
{
  for( const auto& rpBuffer : i_rBuffers )
  {
    if( rpBuffer->Size() != 0 )
    {
      o_rSpans.emplace_back( rpBuffer->Data(), rpBuffer->Size() );
    }
  }
}

}
