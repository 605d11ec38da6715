#include "Utils/UtilsMemory/Allocator.h"

#include <new>

namespace UtilsMemory
{

namespace
{

VGlobalFreeAllocator*& OwnerOf( void* i_pMemory )
{
  return *reinterpret_cast<VGlobalFreeAllocator**>( static_cast<std::byte*>( i_pMemory ) - VGlobalFreeAllocator::HiddenBytes );
}

}

void VGlobalFreeAllocator::Free( void* i_pMemory )
{
  if( i_pMemory ) OwnerOf( i_pMemory )->FreeOwned( i_pMemory );
}

void VGlobalFreeAllocator::Own( void* i_pMemory ) { OwnerOf( i_pMemory ) = this; }

void* VGlobalFreeAllocatorNewDelete::Allocate( size_t i_Size )
{
  if( i_Size > MaxAllocation() - HiddenBytes ) return nullptr;
  auto* pRaw = static_cast<std::byte*>( ::operator new( i_Size + HiddenBytes, std::nothrow ) );
  if( !pRaw ) return nullptr;
  Own( pRaw + HiddenBytes );
  return pRaw + HiddenBytes;
}

void VGlobalFreeAllocatorNewDelete::FreeOwned( void* i_pMemory ) { ::operator delete( static_cast<std::byte*>( i_pMemory ) - HiddenBytes ); }

}
