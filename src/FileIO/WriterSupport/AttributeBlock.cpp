#include "FileIO/WriterSupport/AttributeBlock.h"

#include "Utils/UtilsIO/StreamAdapters.h"

#include <boost/format.hpp>

#include <array>
#include <limits>
#include <stdexcept>

namespace WriterSupport
{

namespace
{

constexpr uint64_t LargestBlock = 64 * 1024 * 1024;   // bytes; far more than any recording describes

bool FitsLength( size_t i_Size ) { return i_Size <= std::numeric_limits<uint32_t>::max(); }

bool WriteNumber( KVZ::IOutputStream& o_rStream, size_t i_Number )
{
  const auto Number = static_cast<uint32_t>( i_Number );
  return FitsLength( i_Number ) && o_rStream.Write( &Number, sizeof( Number ) );
}

// Reads the fields of a block, none of them past its end. Throws std::runtime_error with the reason.
class VBlockParser
{
public:
  VBlockParser( KVZ::IInputStream& i_rStream, uint64_t i_Available )
    : m_rStream( i_rStream ), m_Left( std::min( i_Available, LargestBlock ) ), m_bLimited( i_Available > LargestBlock )
  {
  }

  void Parse( KVZ::IVideoAttributes& o_rAttributes )
  {
    const auto Count = Take<uint32_t>();
    std::string Previous;
    for( m_Entry = 1; m_Entry <= Count; ++m_Entry )
    {
      const std::string Key = TakeText();
      if( m_Entry > 1 && Key <= Previous )
      {
        Fail( "the keys are not in ascending order" );
      }
      TakeValue( Key, o_rAttributes );
      Previous = Key;
    }
  }

private:
  [[noreturn]] void Fail( const std::string& i_rReason ) const
  {
    throw std::runtime_error( m_Entry == 0 ? i_rReason : ( boost::format( "entry %1%: %2%" ) % m_Entry % i_rReason ).str() );
  }

  // Before anything is allocated or read.
  void RequireRoom( uint64_t i_Size ) const
  {
    if( i_Size > m_Left )
    {
      Fail( m_bLimited ? "it is longer than any attribute block can be" : "it runs past the end of the file" );
    }
  }

  void TakeBytes( void* o_pData, uint64_t i_Size )
  {
    RequireRoom( i_Size );
    if( !m_rStream.Read( o_pData, i_Size ) )
    {
      Fail( "it could not be read" );
    }
    m_Left -= i_Size;
  }

  template<class T>
  T Take()
  {
    T Value{};
    TakeBytes( &Value, sizeof( Value ) );
    return Value;
  }

  std::string TakeText()
  {
    const auto Length = Take<uint32_t>();
    RequireRoom( Length );
    std::string Text( Length, '\0' );
    TakeBytes( Text.data(), Length );
    return Text;
  }

  template<class T>
  static void TakeAs( VBlockParser& io_rParser, const std::string& i_rKey, KVZ::IVideoAttributes& o_rAttributes )
  {
    if constexpr( std::is_same_v<T, std::string> )
    {
      o_rAttributes.Set( i_rKey, io_rParser.TakeText() );
    }
    else if constexpr( std::is_same_v<T, bool> )
    {
      o_rAttributes.Set( i_rKey, io_rParser.Take<uint8_t>() != 0 );
    }
    else
    {
      o_rAttributes.Set( i_rKey, io_rParser.Take<T>() );
    }
  }

  void TakeValue( const std::string& i_rKey, KVZ::IVideoAttributes& o_rAttributes )
  {
    using VTaker = void ( * )( VBlockParser&, const std::string&, KVZ::IVideoAttributes& );
    constexpr std::array<VTaker, 12> Takers = { TakeAs<bool>, TakeAs<char>, TakeAs<int16_t>, TakeAs<int32_t>, TakeAs<int64_t>, TakeAs<uint8_t>,
      TakeAs<uint16_t>, TakeAs<uint32_t>, TakeAs<uint64_t>, TakeAs<float>, TakeAs<double>, TakeAs<std::string> };

    const auto Tag = Take<uint32_t>();
    if( Tag >= Takers.size() )
    {
      Fail( ( boost::format( "unknown type %1%" ) % Tag ).str() );
    }
    Takers[Tag]( *this, i_rKey, o_rAttributes );
  }

  KVZ::IInputStream& m_rStream;
  uint64_t m_Left;
  const bool m_bLimited;
  uint32_t m_Entry = 0;   // counts from 1
};

}

bool WriteAttributeBlock( KVZ::IOutputStream& o_rStream, const KVZ::IVideoAttributes& i_rAttributes )
{
  std::vector<uint8_t> Bytes;
  KVZ::ISimpleStreamAdapter Block( Bytes );
  bool bGood = WriteNumber( Block, i_rAttributes.Values().size() );
  for( const auto& [rKey, rpValue] : i_rAttributes.Values() )
  {
    bGood = bGood && WriteNumber( Block, rKey.size() ) && Block.Write( rKey.data(), rKey.size() ) && rpValue->Write( Block );
  }
  return bGood && o_rStream.Write( Bytes.data(), Bytes.size() );
}

bool ReadAttributeBlock( KVZ::IInputStream& i_rStream, uint64_t i_Available, KVZ::IVideoAttributes& o_rAttributes, std::string& o_rError )
try
{
  o_rAttributes = {};
  VBlockParser( i_rStream, i_Available ).Parse( o_rAttributes );
  return true;
}
catch( const std::runtime_error& rError )
{
  o_rError = rError.what();
  return false;
}

}
