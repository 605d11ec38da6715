// A vector of bytes that leaves what resize adds as it lies in memory, for buffers that are filled at once: writing zeros first would cost
// more than much of what is done with them.
#pragma once

#include <cstdint>
#include <memory>
#include <new>
#include <vector>

namespace UtilsMemory
{

template<class T>
struct VUnsetAllocator : std::allocator<T>
{
  template<class TOther>
  struct rebind
  {
    using other = VUnsetAllocator<TOther>;
  };

  VUnsetAllocator() = default;
  template<class TOther>
  VUnsetAllocator( const VUnsetAllocator<TOther>& ) noexcept
  {
  }

  template<class TOther>
  void construct( TOther* o_pPlace ) noexcept
  {
    ::new( static_cast<void*>( o_pPlace ) ) TOther;
  }
  template<class TOther, class... TArgs>
  void construct( TOther* o_pPlace, TArgs&&... i_rArgs )
  {
    ::new( static_cast<void*>( o_pPlace ) ) TOther( std::forward<TArgs>( i_rArgs )... );
  }
};

using VByteVector = std::vector<uint8_t, VUnsetAllocator<uint8_t>>;

}
