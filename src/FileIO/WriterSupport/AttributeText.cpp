#include "FileIO/WriterSupport/AttributeText.h"

#include <charconv>

namespace WriterSupport
{

namespace
{

std::string ToText( const std::string& i_rValue ) { return i_rValue; }
std::string ToText( bool i_bValue ) { return i_bValue ? "true" : "false"; }
std::string ToText( char i_Value ) { return std::to_string( static_cast<signed char>( i_Value ) ); }

template<class T>
std::string ToText( T i_Value )
{
  char Digits[64];   // more than any number takes
  return { Digits, std::to_chars( Digits, Digits + sizeof( Digits ), i_Value ).ptr };
}

template<class T>
bool Take( const KVZ::IVideoAttributes& i_rAttributes, const std::string& i_rKey, std::string& o_rText )
{
  T Value{};
  if( !i_rAttributes.Get( i_rKey, Value ) )
  {
    return false;
  }
  o_rText = ToText( Value );
  return true;
}

template<class... T>
std::string TakeFirst( const KVZ::IVideoAttributes& i_rAttributes, const std::string& i_rKey )
{
  std::string Text;
  static_cast<void>( ( Take<T>( i_rAttributes, i_rKey, Text ) || ... ) );
  return Text;
}

}

std::string GetAttributeText( const KVZ::IVideoAttributes& i_rAttributes, const std::string& i_rKey )
{
  return TakeFirst<std::string, bool, char, int16_t, int32_t, int64_t, uint8_t, uint16_t, uint32_t, uint64_t, float, double>( i_rAttributes, i_rKey );
}

}
