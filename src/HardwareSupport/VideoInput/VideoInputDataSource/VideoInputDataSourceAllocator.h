// The blocks that a device's frames travel in: memory of the data source's buffer, so that a frame is stored without a copy.
#pragma once

#include "HardwareSupport/VideoInput/VideoInputHAL/VideoInputDevice.h"
#include "SyncSystem/CaptureBufferAllocator.h"

#include <memory>

namespace VideoInputHAL
{

class VVideoInputDataSourceAllocator : public IVideoInputAllocator
{
public:
  explicit VVideoInputDataSourceAllocator( std::shared_ptr<SyncSystem::VCaptureBufferAllocator> i_pAllocator )
    : m_pAllocator( std::move( i_pAllocator ) )
  {
  }

  void* Allocate( uint64_t i_Bytes ) override { return m_pAllocator->Allocate( i_Bytes ); }
  void Free( void* i_pBlock ) override { m_pAllocator->Free( i_pBlock ); }

  const std::shared_ptr<SyncSystem::VCaptureBufferAllocator>& BufferAllocator() const { return m_pAllocator; }

private:
  const std::shared_ptr<SyncSystem::VCaptureBufferAllocator> m_pAllocator;
};

}
