// The size of a frame's image by its description.
#pragma once

#include "Core/VideoInterface/FrameRecords.h"

namespace CoreVideoUtils
{

// Bytes; 0 where width, height or format is unknown.
inline uint64_t GetFrameSize( const KVZ::VideoFrameInfo& i_rInfo )
{
  return KVZ::GetImageSize( i_rInfo.m_PixelFormat, i_rInfo.m_ImageWidth, i_rInfo.m_ImageHeight );
}

}
