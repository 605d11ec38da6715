#include "HardwareSupport/VideoInput/VideoInputHAL/VideoInputFrame.h"

#include "HardwareSupport/VideoInput/VideoInputHAL/VideoInputDevice.h"

#include <new>

namespace VideoInputHAL
{

VVideoInputDataSourceFrame* MakeFrame( IVideoInputAllocator* i_pAllocator, const KVZ::VideoFrameInfo& i_rInfo, uint64_t i_ImageBytes,
  uint64_t i_AudioBytes )
{
  void* const pBlock = i_pAllocator ? i_pAllocator->Allocate( VVideoInputDataSourceFrame::BlockSize( i_ImageBytes, i_AudioBytes ) ) : nullptr;
  if( !pBlock )
  {
    return nullptr;
  }
  auto* const pFrame = new( pBlock ) VVideoInputDataSourceFrame;
  pFrame->m_pAllocator = i_pAllocator;
  pFrame->m_VideoInfo = i_rInfo;
  pFrame->m_ImageBytes = static_cast<uint32_t>( i_ImageBytes );
  pFrame->m_ImageCapacity = static_cast<uint32_t>( VVideoInputDataSourceFrame::RoundUp( i_ImageBytes ) );
  pFrame->m_AudioBytes = static_cast<uint32_t>( i_AudioBytes );
  pFrame->m_AudioCapacity = pFrame->m_AudioBytes;
  return pFrame;
}

}
