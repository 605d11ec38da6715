// How typed values become a Variant's bytes and come back. Part of Variant.h, which says what the bytes are.
#pragma once

#include "StageCoreRuntime/Variant.h"

namespace KVZ
{
namespace VariantDetail
{
template<class T>
constexpr ISchema::EType PodType()
{
  if constexpr( std::is_same_v<T, bool> )
  {
    return ISchema::EBool;
  }
  else if constexpr( std::is_floating_point_v<T> )
  {
    static_assert( sizeof( T ) <= sizeof( double ) );
    return sizeof( T ) == sizeof( float ) ? ISchema::EFloat : ISchema::EDouble;
  }
  else
  {
    constexpr int Step = sizeof( T ) == 8 ? 3 : static_cast<int>( sizeof( T ) ) / 2;
    return static_cast<ISchema::EType>( ( std::is_signed_v<T> ? ISchema::EInt8 : ISchema::EUInt8 ) + Step );
  }
}

template<ISchema::EType Type>
struct VPodSchema
{
  static const ISchema* Get()
  {
    static const ISchema* const s_pSchema = IO::GetUniquePodSchema( Type );
    return s_pSchema;
  }
};

template<class T>
struct VIsVector : std::false_type
{
};

template<class T>
struct VIsVector<std::vector<T>> : std::true_type
{
};

template<class T>
constexpr bool IsScalar = std::is_arithmetic_v<T> || std::is_enum_v<T>;

class VWriter
{
public:
  void Raw( const void* i_pData, size_t i_Size )
  {
    const auto* pData = static_cast<const uint8_t*>( i_pData );
    m_Bytes.insert( m_Bytes.end(), pData, pData + i_Size );
  }

  void Counted( const void* i_pData, size_t i_Size )
  {
    Count( i_Size );
    Raw( i_pData, i_Size );
  }

  void Count( size_t i_Count )
  {
    const auto Count = static_cast<uint32_t>( i_Count );
    Raw( &Count, sizeof( Count ) );
  }

  template<class T>
  void operator()( const T& i_rValue )
  {
    if constexpr( std::is_same_v<T, bool> )
    {
      m_Bytes.push_back( i_rValue ? 1 : 0 );
    }
    else if constexpr( IsScalar<T> )
    {
      static_assert( !std::is_enum_v<T> || sizeof( T ) == sizeof( int32_t ), "an enumeration in a Variant has 32 bits" );
      Raw( &i_rValue, sizeof( T ) );
    }
    else if constexpr( std::is_same_v<T, std::string> )
    {
      Counted( i_rValue.data(), i_rValue.size() );
    }
    else if constexpr( VIsVector<T>::value )
    {
      Count( i_rValue.size() );
      for( const auto& rElement : i_rValue )
      {
        ( *this )( static_cast<const typename T::value_type&>( rElement ) );
      }
    }
    else
    {
      VSchemaOf<T>::Visit( i_rValue, *this );
    }
  }

  Variant::VBytes m_Bytes;
};

// Remembers a failure; what is read after one is meaningless.
class VReader
{
public:
  explicit VReader( const Variant::VBytes& i_rBytes ) : m_pData( i_rBytes.data() ), m_Left( i_rBytes.size() ) {}

  bool IsGood() const { return m_bGood; }
  bool IsDone() const { return m_bGood && m_Left == 0; }

  // Where the next bytes lie.
  const uint8_t* Position() const { return m_pData; }

  // The next bytes, or null if there are fewer left.
  const uint8_t* Raw( size_t i_Size )
  {
    if( !m_bGood || i_Size > m_Left )
    {
      m_bGood = false;
      return nullptr;
    }
    const uint8_t* pData = m_pData;
    m_pData += i_Size;
    m_Left -= i_Size;
    return pData;
  }

  // A count of things that take a byte at least, so no count makes a reader allocate more than there are bytes.
  uint32_t Count()
  {
    uint32_t Count = 0;
    ( *this )( Count );
    m_bGood = m_bGood && Count <= m_Left;
    return m_bGood ? Count : 0;
  }

  template<class T>
  void operator()( T& o_rValue )
  {
    if constexpr( std::is_same_v<T, bool> )
    {
      const uint8_t* pData = Raw( 1 );
      o_rValue = pData && *pData != 0;
    }
    else if constexpr( IsScalar<T> )
    {
      if( const uint8_t* pData = Raw( sizeof( T ) ) )
      {
        std::memcpy( &o_rValue, pData, sizeof( T ) );
      }
    }
    else if constexpr( std::is_same_v<T, std::string> )
    {
      const uint32_t Size = Count();
      const uint8_t* pData = Raw( Size );
      o_rValue.assign( reinterpret_cast<const char*>( pData ), pData ? Size : 0 );
    }
    else if constexpr( VIsVector<T>::value )
    {
      o_rValue.clear();
      for( uint32_t Left = Count(); Left > 0 && m_bGood; --Left )
      {
        typename T::value_type Element{};
        ( *this )( Element );
        o_rValue.push_back( std::move( Element ) );
      }
    }
    else
    {
      VSchemaOf<T>::Visit( o_rValue, *this );
    }
  }

private:
  const uint8_t* m_pData;
  size_t m_Left;
  bool m_bGood = true;
};
}

template<class T>
requires std::is_arithmetic_v<T>
struct VSchemaOf<T> : VariantDetail::VPodSchema<VariantDetail::PodType<T>()>
{
};

template<>
struct VSchemaOf<std::string> : VariantDetail::VPodSchema<ISchema::EString>
{
};

template<class T>
struct VSchemaOf<std::vector<T>>
{
  static const ISchema* Get()
  {
    static const ISchema* const s_pSchema = IO::GetUniqueListSchema( VSchemaOf<T>::Get() );
    return s_pSchema;
  }
};

template<class T>
Variant Variant::Make( const T& i_rValue )
{
  if constexpr( std::is_same_v<T, std::string> )
  {
    return MakeText( i_rValue );
  }
  else
  {
    VariantDetail::VWriter Writer;
    Writer( i_rValue );
    return Variant( VSchemaOf<T>::Get(), std::move( Writer.m_Bytes ) );
  }
}

template<class T>
bool Variant::Get( T& o_rValue ) const
{
  if( m_pSchema != VSchemaOf<T>::Get() )
  {
    return false;
  }
  if constexpr( std::is_same_v<T, std::string> )
  {
    o_rValue.assign( reinterpret_cast<const char*>( m_Bytes.data() ), m_Bytes.size() );
    return true;
  }
  else
  {
    T Value{};
    VariantDetail::VReader Reader( m_Bytes );
    Reader( Value );
    if( !Reader.IsDone() )
    {
      return false;
    }
    o_rValue = std::move( Value );
    return true;
  }
}
}
