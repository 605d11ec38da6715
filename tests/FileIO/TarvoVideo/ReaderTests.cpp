#include "tests/support/SmallTvidFile.h"
#include "tests/support/TemporaryFolder.h"

#include <gtest/gtest.h>

using namespace KVZ;
using namespace TarvoVideo;
using namespace TestSupport;

namespace
{

VFrameContent FrameOf( uint64_t i_Key )
{
  return { VBytes( 4, static_cast<uint8_t>( i_Key ) ), VBytes( i_Key % 3 * 2, static_cast<uint8_t>( 0xF0 + i_Key ) ) };
}

VContents Contents( uint64_t i_Count )
{
  VContents Result;
  for( uint64_t Key = 0; Key < i_Count; ++Key )
  {
    Result[Key] = FrameOf( Key );
  }
  return Result;
}

// Five frames with the keys 0 to 4; without Close where it is to be an unfinished one.
VBytes MakeFile( bool i_bClose )
{
  VSmallFile File;
  EXPECT_TRUE( File.Begin() );
  for( const auto& [Key, rContent] : Contents( 5 ) )
  {
    EXPECT_TRUE( File.WriteFrame( Key, rContent ) );
  }
  EXPECT_TRUE( !i_bClose || File.m_Writer.Close() );
  return *File.m_pBytes;
}

bool IsOneLine( const std::string& i_rText )
{
  return !i_rText.empty() && i_rText.size() < 200 &&
    std::all_of( i_rText.begin(), i_rText.end(), []( unsigned char i_Char ) { return std::isprint( i_Char ); } );
}

}

TEST( TarvoReader, AnUnfinishedFileGivesItsWholeFramesAtEveryLength )
{
  const VBytes Whole = MakeFile( false );
  uint64_t Most = 0;
  for( size_t Length = 0; Length <= Whole.size(); ++Length )
  {
    SCOPED_TRACE( Length );
    const VBytes Cut( Whole.begin(), Whole.begin() + static_cast<std::ptrdiff_t>( Length ) );
    const VFound Found = ReadAll( Cut );
    EXPECT_FALSE( Found.m_bFinished );
    EXPECT_TRUE( Found.m_Error.empty() || IsOneLine( Found.m_Error ) );
    EXPECT_EQ( Found.m_Frames, Contents( Found.m_Frames.size() ) );
    EXPECT_GE( Found.m_Frames.size(), Most );
    Most = Found.m_Frames.size();

    VReader Reader;
    uint64_t Count = 0;
    VFrameRecord Record;
    if( Reader.Open( std::make_unique<ISimpleInputStreamAdapter>( Cut ), Cut.size() ) )
    {
      EXPECT_EQ( Reader.GetVideoInfo(), VideoInfo() );
      EXPECT_EQ( Reader.GetAudioInfo(), MonoAudio );
      EXPECT_TRUE( Reader.CountFrames( Count ) );
      uint64_t End = 0;
      while( Reader.Next( Record ) )
      {
        End = Record.m_Audio.m_Position + Record.m_Audio.m_Size;
        --Count;
      }
      EXPECT_EQ( Count, 0u );
      EXPECT_TRUE( End == 0 || End + Reader.GetTrailingBytes() == Length );
    }
  }
  EXPECT_EQ( Most, 5u );
}

TEST( TarvoReader, AClosedFileThatWasCutIsAlwaysAnError )
{
  const VBytes Whole = MakeFile( true );
  EXPECT_EQ( ReadAll( Whole ).m_Frames, Contents( 5 ) );
  for( size_t Length = 0; Length < Whole.size(); ++Length )
  {
    SCOPED_TRACE( Length );
    const VFound Found = ReadAll( VBytes( Whole.begin(), Whole.begin() + static_cast<std::ptrdiff_t>( Length ) ) );
    EXPECT_TRUE( IsOneLine( Found.m_Error ) ) << Found.m_Error;
    EXPECT_TRUE( Found.m_Frames.empty() );
  }
}

// Every byte in turn takes several wrong values. What still opens has ended, within the file, and with sensible errors.
TEST( TarvoReader, AnyDamagedByteEndsInFramesOrOneLine )
{
  for( const bool bClosed : { true, false } )
  {
    const VBytes Whole = MakeFile( bClosed );
    size_t Refused = 0;
    for( size_t Position = 0; Position < Whole.size(); ++Position )
    {
      for( const int Change : { 0x01, 0x80, 0xFF, 0x40 } )
      {
        SCOPED_TRACE( testing::Message() << ( bClosed ? "closed " : "unfinished " ) << Position << " ^ " << Change );
        VBytes Damaged = Whole;
        Damaged[Position] = static_cast<uint8_t>( Damaged[Position] ^ Change );
        const VFound Found = ReadAll( Damaged );
        EXPECT_TRUE( Found.m_Error.empty() || IsOneLine( Found.m_Error ) ) << Found.m_Error;
        EXPECT_LE( Found.m_Frames.size(), Whole.size() / 4 );
        Refused += !Found.m_Error.empty();
      }
    }
    EXPECT_GT( Refused, Whole.size() );
  }
}

// Lengths that no file of this size can have must not be believed, not even to ask for the memory.
TEST( TarvoReader, LengthsFromTheFileAreCheckedBeforeUse )
{
  const auto Damage = []( bool i_bClosed, size_t i_Position, const VBytes& i_rBytes )
  {
    VBytes File = MakeFile( i_bClosed );
    std::copy( i_rBytes.begin(), i_rBytes.end(), File.begin() + static_cast<std::ptrdiff_t>( i_Position ) );
    return ReadAll( File ).m_Error;
  };
  const VBytes Huge = VLittleEndian().U32( 0xFFFFFFF0 ).m_Bytes;
  EXPECT_EQ( Damage( false, 48, Huge ), "The internal attribute block at 48 is damaged: entry 14: the keys are not in ascending order." );
  EXPECT_EQ( Damage( false, 52, Huge ), "The internal attribute block at 48 is damaged: entry 1: it runs past the end of the file." );
  // In a file that is said to be long enough for the length, the block's own limit holds.
  VBytes Long = MakeFile( false );
  std::copy( Huge.begin(), Huge.end(), Long.begin() + 52 );
  VReader Reader;
  EXPECT_FALSE( Reader.Open( std::make_unique<ISimpleInputStreamAdapter>( Long ), uint64_t{ 1 } << 40 ) );
  EXPECT_EQ( Reader.GetError(), "The internal attribute block at 48 is damaged: entry 1: it is longer than any attribute block can be." );

  const VBytes Whole = MakeFile( true );
  const size_t IndexPosition = Whole.size() - 5 * 16 - 8;
  EXPECT_EQ( Damage( true, IndexPosition, VLittleEndian().U64( 0x1000000000000005 ).m_Bytes ),
    "The index is said to have 1152921504606846981 entries of 16 bytes, but 80 bytes are there." );
  EXPECT_EQ( Damage( true, IndexPosition + 16, VLittleEndian().U64( 0xFFFFFFFFFFFFFFFE ).m_Bytes ),
    "The index is damaged: a frame of 8 bytes cannot be at 18446744073709551614." );
  EXPECT_EQ( Damage( true, 40, VLittleEndian().U64( 0xFFFFFFFFFFFFFFFE ).m_Bytes ).substr( 0, 21 ), "The index is said to " );
}

TEST( TarvoReader, WhatIsNoFileOfOursIsRefused )
{
  const VTemporaryFolder Folder;
  VReader Reader;
  for( const std::string& rPath : { Folder.File( "missing.tvid" ), Folder.File( "" ), std::string( "/dev/null" ) } )
  {
    EXPECT_FALSE( Reader.Open( rPath ) );
    EXPECT_EQ( Reader.GetError(), "The file could not be opened." );
  }
  EXPECT_EQ( ReadAll( VBytes( 100, 'x' ) ).m_Error, "Not a tvid file: it does not begin with the words of one." );
  EXPECT_EQ( ReadAll( VBytes() ).m_Error, "Not a tvid file: it has 0 bytes, and the header alone takes 48." );
}
