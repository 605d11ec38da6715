// Bytes that end where readable memory ends: a read or write past them is a crash. What lies before them is filled with a pattern.
#pragma once

#include <sys/mman.h>
#include <unistd.h>

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <new>

class VGuardedBytes
{
public:
  explicit VGuardedBytes( size_t i_Size ) : m_Page( static_cast<size_t>( sysconf( _SC_PAGESIZE ) ) ), m_Size( i_Size )
  {
    m_Mapped = ( ( i_Size + Front + m_Page - 1 ) / m_Page + 1 ) * m_Page;
    void* const pMemory = mmap( nullptr, m_Mapped, PROT_READ | PROT_WRITE, MAP_PRIVATE | MAP_ANONYMOUS, -1, 0 );
    if( pMemory == MAP_FAILED )
    {
      throw std::bad_alloc();
    }
    m_pMemory = static_cast<uint8_t*>( pMemory );
    mprotect( m_pMemory + m_Mapped - m_Page, m_Page, PROT_NONE );
    m_pBytes = m_pMemory + m_Mapped - m_Page - i_Size;
    std::fill_n( m_pBytes - Front, Front + i_Size, Pattern );
  }
  ~VGuardedBytes() { munmap( m_pMemory, m_Mapped ); }
  VGuardedBytes( const VGuardedBytes& ) = delete;
  VGuardedBytes& operator=( const VGuardedBytes& ) = delete;

  uint8_t* Data() { return m_pBytes; }
  const uint8_t* Data() const { return m_pBytes; }
  size_t Size() const { return m_Size; }

  bool IsFrontWhole() const
  {
    return std::all_of( m_pBytes - Front, m_pBytes, []( uint8_t i_Byte ) { return i_Byte == Pattern; } );
  }
  bool operator==( const VGuardedBytes& i_rOther ) const
  {
    return std::equal( m_pBytes, m_pBytes + m_Size, i_rOther.m_pBytes, i_rOther.m_pBytes + i_rOther.m_Size );
  }

private:
  static constexpr size_t Front = 256;
  static constexpr uint8_t Pattern = 0xA5;

  const size_t m_Page;
  const size_t m_Size;
  size_t m_Mapped = 0;
  uint8_t* m_pMemory = nullptr;
  uint8_t* m_pBytes = nullptr;
};
