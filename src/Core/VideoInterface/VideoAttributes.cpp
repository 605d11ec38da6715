#include "Core/VideoInterface/VideoAttributes.h"

#include <bit>
#include <limits>

namespace KVZ
{

static_assert( std::endian::native == std::endian::little, "Values go to disk as they lie in memory." );

namespace
{

template<class T>
struct VTypeTag;
template<>
struct VTypeTag<bool>
{
  static constexpr uint32_t Value = 0;
};
template<>
struct VTypeTag<char>
{
  static constexpr uint32_t Value = 1;
};
template<>
struct VTypeTag<int16_t>
{
  static constexpr uint32_t Value = 2;
};
template<>
struct VTypeTag<int32_t>
{
  static constexpr uint32_t Value = 3;
};
template<>
struct VTypeTag<int64_t>
{
  static constexpr uint32_t Value = 4;
};
template<>
struct VTypeTag<uint8_t>
{
  static constexpr uint32_t Value = 5;
};
template<>
struct VTypeTag<uint16_t>
{
  static constexpr uint32_t Value = 6;
};
template<>
struct VTypeTag<uint32_t>
{
  static constexpr uint32_t Value = 7;
};
template<>
struct VTypeTag<uint64_t>
{
  static constexpr uint32_t Value = 8;
};
template<>
struct VTypeTag<float>
{
  static constexpr uint32_t Value = 9;
};
template<>
struct VTypeTag<double>
{
  static constexpr uint32_t Value = 10;
};
template<>
struct VTypeTag<std::string>
{
  static constexpr uint32_t Value = 11;
};
static_assert( sizeof( bool ) == 1 );

template<class T>
bool WriteValue( IOutputStream& o_rStream, const T& i_rValue )
{
  return o_rStream.Write( &i_rValue, sizeof( T ) );
}

template<>
bool WriteValue( IOutputStream& o_rStream, const std::string& i_rValue )
{
  const auto Length = static_cast<uint32_t>( i_rValue.size() );
  return i_rValue.size() <= std::numeric_limits<uint32_t>::max() && WriteValue( o_rStream, Length ) && o_rStream.Write( i_rValue.data(), Length );
}

}

template<class T>
class VValueTyped : public IVideoAttributes::IValue
{
public:
  explicit VValueTyped( const T& i_rValue ) : m_Value( i_rValue ) {}

  const T& Value() const { return m_Value; }

  bool IsEqual( const IValue& i_rOther ) const override
  {
    const auto* pOther = dynamic_cast<const VValueTyped*>( &i_rOther );
    return pOther && pOther->m_Value == m_Value;
  }

  uint32_t GetTypeTag() const override { return m_Tag; }

  bool Write( IOutputStream& o_rStream ) const override { return WriteValue( o_rStream, m_Tag ) && WriteValue( o_rStream, m_Value ); }

private:
  const T m_Value;
  const uint32_t m_Tag = VTypeTag<T>::Value;
};

template<class T>
void IVideoAttributes::Set( const std::string& i_rKey, const T& i_rValue )
{
  m_Values[i_rKey] = std::make_shared<VValueTyped<T>>( i_rValue );
}

template<class T>
bool IVideoAttributes::Get( const std::string& i_rKey, T& o_rValue ) const
{
  const auto Found = m_Values.find( i_rKey );
  const auto* pValue = Found == m_Values.end() ? nullptr : dynamic_cast<const VValueTyped<T>*>( Found->second.get() );
  if( !pValue )
  {
    return false;
  }
  o_rValue = pValue->Value();
  return true;
}

#define KVZ_ATTRIBUTE_TYPE( T )                                           \
  template void IVideoAttributes::Set<T>( const std::string&, const T& ); \
  template bool IVideoAttributes::Get<T>( const std::string&, T& ) const;
KVZ_ATTRIBUTE_TYPE( bool )
KVZ_ATTRIBUTE_TYPE( char )
KVZ_ATTRIBUTE_TYPE( int16_t )
KVZ_ATTRIBUTE_TYPE( int32_t )
KVZ_ATTRIBUTE_TYPE( int64_t )
KVZ_ATTRIBUTE_TYPE( uint8_t )
KVZ_ATTRIBUTE_TYPE( uint16_t )
KVZ_ATTRIBUTE_TYPE( uint32_t )
KVZ_ATTRIBUTE_TYPE( uint64_t )
KVZ_ATTRIBUTE_TYPE( float )
KVZ_ATTRIBUTE_TYPE( double )
KVZ_ATTRIBUTE_TYPE( std::string )
#undef KVZ_ATTRIBUTE_TYPE

bool IVideoAttributes::operator==( const IVideoAttributes& i_rOther ) const
{
  if( m_Values.size() != i_rOther.m_Values.size() )
  {
    return false;
  }
  for( auto Mine = m_Values.begin(), Other = i_rOther.m_Values.begin(); Mine != m_Values.end(); ++Mine, ++Other )
  {
    if( Mine->first != Other->first || !Mine->second->IsEqual( *Other->second ) )
    {
      return false;
    }
  }
  return true;
}

}
