// Whole files, byte for byte. The numbers come from the file format, not from the writer.
#include "tests/FileIO/MovIO/SmallMovie.h"
#include "tests/support/ByteBuilder.h"
#include "tests/support/LogCapture.h"

#include <gtest/gtest.h>

using namespace KVZ;
using namespace MovIO;
using namespace TestSupport;

namespace
{

void AddDataReference( VBigEndian& io_rFile )
{
  io_rFile.Atom( 36, "dinf" ).Atom( 28, "dref" ).U32( 0 ).U32( 1 );   // version and flags, entries
  io_rFile.Atom( 12, "url " ).U32( 1 );                               // in this file
}

void AddVideoTrack( VBigEndian& io_rFile )
{
  io_rFile.Atom( 650, "trak" );
  io_rFile.Atom( 92, "tkhd" ).U32( 0xF ).Zeros( 8 ).U32( 1 ).U32( 0 ).U32( 1920 );   // flags, times, id, reserved, duration
  io_rFile.Zeros( 8 ).Zeros( 4 ).U16( 0 ).U16( 0 ).Matrix();                         // reserved, layer and group, volume, reserved
  io_rFile.U32( 0x40000 ).U32( 0x20000 );                                            // 4 x 2
  io_rFile.Atom( 68, "tapt" );
  io_rFile.Atom( 20, "clef" ).U32( 0 ).U32( 0x40000 ).U32( 0x20000 );
  io_rFile.Atom( 20, "prof" ).U32( 0 ).U32( 0x40000 ).U32( 0x20000 );
  io_rFile.Atom( 20, "enof" ).U32( 0 ).U32( 0x40000 ).U32( 0x20000 );
  io_rFile.Atom( 36, "edts" ).Atom( 28, "elst" ).U32( 0 ).U32( 1 ).U32( 1920 ).U32( 0 ).U32( 0x10000 );   // duration, media time, rate
  io_rFile.Atom( 32, "tref" ).Atom( 12, "sync" ).U32( 2 ).Atom( 12, "tmcd" ).U32( 3 );
  io_rFile.Atom( 414, "mdia" );
  io_rFile.Atom( 32, "mdhd" ).U32( 0 ).Zeros( 8 ).U32( 48000 ).U32( 1920 ).U16( 0x7FFF ).U16( 0 );
  io_rFile.Atom( 59, "hdlr" ).U32( 0 ).Raw( "mhlrvideappl" ).U32( 0x10000000 ).U32( 0x1023F ).Pascal( "Apple Video Media Handler" ).U8( 0 );
  io_rFile.Atom( 315, "minf" );
  io_rFile.Atom( 20, "vmhd" ).U32( 1 ).U16( 0 ).U16( 0x8000 ).U16( 0x8000 ).U16( 0x8000 );
  io_rFile.Atom( 45, "hdlr" ).U32( 0 ).Raw( "dhlrurl " ).Zeros( 12 ).Pascal( "DataHandler" ).U8( 0 );
  AddDataReference( io_rFile );
  io_rFile.Atom( 206, "stbl" );
  io_rFile.Atom( 102, "stsd" ).U32( 0 ).U32( 1 );
  io_rFile.Atom( 86, "2vuy" ).Zeros( 6 ).U16( 1 );                                    // data reference
  io_rFile.U16( 1 ).U16( 0 ).Raw( "tmsl" ).U32( 0 ).U32( 0x200 );                     // version, revision, vendor, qualities
  io_rFile.U16( 4 ).U16( 2 ).U32( 0x480000 ).U32( 0x480000 ).U32( 0 ).U16( 1 );       // size, 72 dots an inch, one frame
  io_rFile.Pascal( "Uncompressed 8-bit 4:2:2" ).Zeros( 7 ).U16( 24 ).U16( 0xFFFF );   // 32 bytes, depth, colour table
  io_rFile.Atom( 24, "stts" ).U32( 0 ).U32( 1 ).U32( 1 ).U32( 1920 );                 // one frame of 40 ms
  io_rFile.Atom( 28, "stsc" ).U32( 0 ).U32( 1 ).U32( 1 ).U32( 1 ).U32( 1 );
  io_rFile.Atom( 20, "stsz" ).U32( 0 ).U32( 16 ).U32( 1 );
  io_rFile.Atom( 24, "co64" ).U32( 0 ).U32( 1 ).U64( 52 );
}

void AddAudioTrack( VBigEndian& io_rFile )
{
  io_rFile.Atom( 517, "trak" );
  io_rFile.Atom( 92, "tkhd" ).U32( 3 ).Zeros( 8 ).U32( 2 ).U32( 0 ).U32( 2 );
  io_rFile.Zeros( 8 ).Zeros( 4 ).U16( 0x100 ).U16( 0 ).Matrix().U32( 0 ).U32( 0 );   // volume 1
  io_rFile.Atom( 36, "edts" ).Atom( 28, "elst" ).U32( 0 ).U32( 1 ).U32( 2 ).U32( 0 ).U32( 0x10000 );
  io_rFile.Atom( 381, "mdia" );
  io_rFile.Atom( 32, "mdhd" ).U32( 0 ).Zeros( 8 ).U32( 48000 ).U32( 2 ).U16( 0x7FFF ).U16( 0 );
  io_rFile.Atom( 45, "hdlr" ).U32( 0 ).Raw( "mhlrsoun" ).Zeros( 12 ).Pascal( "SoundHandler" );   // without a zero behind it
  io_rFile.Atom( 296, "minf" );
  io_rFile.Atom( 16, "smhd" ).U32( 0 ).U16( 0 ).U16( 0 );
  io_rFile.Atom( 44, "hdlr" ).U32( 0 ).Raw( "dhlrurl " ).Zeros( 12 ).Pascal( "DataHandler" );   // the same
  AddDataReference( io_rFile );
  io_rFile.Atom( 192, "stbl" );
  io_rFile.Atom( 88, "stsd" ).U32( 0 ).U32( 1 );
  io_rFile.Atom( 72, "lpcm" ).U32( 0 ).U16( 0 ).U16( 0 );                    // data reference 0
  io_rFile.U16( 2 ).U16( 0 ).U32( 0 );                                       // version
  io_rFile.U16( 3 ).U16( 16 ).U16( 0xFFFF ).U16( 0 ).U32( 0x10000 );         // fixed by version 2
  io_rFile.U32( 72 ).U64( 0x40E7700000000000 ).U32( 1 ).U32( 0x7F000000 );   // entry size, 48000.0, channels
  io_rFile.U32( 16 ).U32( 12 ).U32( 2 ).U32( 1 );                            // bits, signed and packed, bytes and samples a packet
  io_rFile.Atom( 24, "stts" ).U32( 0 ).U32( 1 ).U32( 2 ).U32( 1 );
  io_rFile.Atom( 28, "stsc" ).U32( 0 ).U32( 1 ).U32( 1 ).U32( 2 ).U32( 1 );
  io_rFile.Atom( 20, "stsz" ).U32( 0 ).U32( 2 ).U32( 2 );
  io_rFile.Atom( 24, "co64" ).U32( 0 ).U32( 1 ).U64( 68 );
}

void AddTimecodeTrack( VBigEndian& io_rFile )
{
  io_rFile.Atom( 568, "trak" );
  io_rFile.Atom( 92, "tkhd" ).U32( 0xF ).Zeros( 8 ).U32( 3 ).U32( 0 ).U32( 1920 );
  io_rFile.Zeros( 8 ).Zeros( 4 ).U16( 0 ).U16( 0 ).Matrix().U32( 0x40000 ).U32( 0x20000 );
  io_rFile.Atom( 36, "edts" ).Atom( 28, "elst" ).U32( 0 ).U32( 1 ).U32( 1920 ).U32( 0 ).U32( 0x10000 );
  io_rFile.Atom( 432, "mdia" );
  io_rFile.Atom( 32, "mdhd" ).U32( 0 ).Zeros( 8 ).U32( 48000 ).U32( 1920 ).U16( 0x7FFF ).U16( 0 );
  io_rFile.Atom( 49, "hdlr" ).U32( 0 ).Raw( "mhlrtmcd" ).Zeros( 12 ).Pascal( "TimeCodeHandler" ).U8( 0 );
  io_rFile.Atom( 343, "minf" );
  io_rFile.Atom( 86, "gmhd" );
  io_rFile.Atom( 24, "gmin" ).U32( 0 ).U16( 0x40 ).U16( 0x8000 ).U16( 0x8000 ).U16( 0x8000 ).U16( 0 ).U16( 0 );
  io_rFile.Atom( 54, "tmcd" ).Atom( 46, "tcmi" ).U32( 0 ).U16( 0 ).U16( 0 ).U16( 12 ).U16( 0 );   // font, face, size
  io_rFile.Zeros( 6 ).U16( 0xFFFF ).U16( 0xFFFF ).U16( 0xFFFF ).Pascal( "Lucida Grande" );        // black on white
  io_rFile.Atom( 12, "nmhd" ).U32( 0 );
  io_rFile.Atom( 45, "hdlr" ).U32( 0 ).Raw( "dhlrurl " ).Zeros( 12 ).Pascal( "DataHandler" ).U8( 0 );
  AddDataReference( io_rFile );
  io_rFile.Atom( 156, "stbl" );
  io_rFile.Atom( 52, "stsd" ).U32( 0 ).U32( 1 );
  io_rFile.Atom( 36, "tmcd" ).Zeros( 6 ).U16( 1 ).U32( 0 ).U32( 0 );   // data reference, flags
  io_rFile.U32( 48000 ).U32( 1920 ).U8( 25 ).U8( 0 ).U16( 0 );
  io_rFile.Atom( 24, "stts" ).U32( 0 ).U32( 1 ).U32( 1 ).U32( 1920 );
  io_rFile.Atom( 28, "stsc" ).U32( 0 ).U32( 1 ).U32( 1 ).U32( 1 ).U32( 1 );
  io_rFile.Atom( 20, "stsz" ).U32( 0 ).U32( 4 ).U32( 1 );
  io_rFile.Atom( 24, "co64" ).U32( 0 ).U32( 1 ).U64( 48 );
}

// Up to the attributes.
VBytes ExpectedFile()
{
  VBigEndian File;
  File.Atom( 32, "ftyp" ).Raw( "qt  " ).U8( 0x20 ).U8( 0x14 ).U8( 0x02 ).U8( 0x11 ).Raw( "qt  " ).Zeros( 12 );
  File.U32( 1 ).Raw( "mdat" ).U64( 40 );          // with a 64-bit size
  File.U32( 90000 );                              // 01:00:00:00, at 48
  File.Raw( "ABCDEFGHIJKLMNOP" ).Raw( "abcd" );   // image at 52, two samples of sound at 68
  File.Atom( 1851, "moov" );
  File.Atom( 108, "mvhd" ).U32( 0 ).Zeros( 8 ).U32( 48000 ).U32( 1920 );   // timescale, duration
  File.U32( 0x10000 ).U16( 0x100 ).Zeros( 10 ).Matrix().Zeros( 24 );       // rate, volume
  File.U32( 3 );                                                           // next track id
  AddVideoTrack( File );
  AddAudioTrack( File );
  AddTimecodeTrack( File );
  return File.m_Bytes;
}

// The first difference is what one wants to know of two files.
void ExpectSameBytes( const VBytes& i_rFound, const VBytes& i_rExpected )
{
  const auto [Found, Expected] = std::mismatch( i_rFound.begin(), i_rFound.end(), i_rExpected.begin(), i_rExpected.end() );
  EXPECT_TRUE( Found == i_rFound.end() && Expected == i_rExpected.end() )
    << "first difference at " << Found - i_rFound.begin() << ", sizes " << i_rFound.size() << " and " << i_rExpected.size();
}

}

TEST( MovFileBytes, ASmallMovieIsTheseBytes )
{
  const VLogCapture Log( "MovIO" );
  VSmallMovie Movie;
  ASSERT_TRUE( Movie.Begin() );
  ASSERT_TRUE( Movie.Frame( Bytes( "ABCDEFGHIJKLMNOP" ), Bytes( "abcd" ) ) );
  ASSERT_TRUE( Movie.m_Writer.Close() );
  const auto Attributes = static_cast<std::ptrdiff_t>( Movie.Parse().Root().Child( "TMSL" ).m_Position );
  ExpectSameBytes( VBytes( Movie.m_pBytes->begin(), Movie.m_pBytes->begin() + Attributes ), ExpectedFile() );
  EXPECT_TRUE( Log.Texts().empty() );
}

TEST( MovFileBytes, AnMP4DiffersInFileTypeReferencesAndTimecodeEntry )
{
  VMovieSettings Settings;
  Settings.m_Container = IVideoContainer::EMP4;
  VSmallMovie Movie( Settings );
  ASSERT_TRUE( Movie.Begin() && Movie.Frame( VBytes( 16 ), VBytes( 4 ) ) && Movie.m_Writer.Close() );
  VBigEndian Start;
  Start.Atom( 28, "ftyp" ).Raw( "mp42" ).U32( 0 ).Raw( "mp42isomavc1" ).U32( 1 ).Raw( "mdat" ).U64( 40 ).U32( 90000 );
  ExpectSameBytes( VBytes( Movie.m_pBytes->begin(), Movie.m_pBytes->begin() + 48 ), Start.m_Bytes );

  const auto Parser = Movie.Parse();
  EXPECT_FALSE( Parser.Root().Child( "moov" ).Child( "trak" ).Has( "tref" ) );
  VBigEndian Entry;
  Entry.U32( 0 ).U32( 1 ).Atom( 34, "tmcd" ).Zeros( 6 ).U16( 1 ).U32( 0 ).U32( 0 ).U32( 48000 ).U32( 1920 ).U8( 25 ).U8( 0 );
  ExpectSameBytes( Parser.Body( SampleTable( Parser, 2 ).Child( "stsd" ) ), Entry.m_Bytes );
}

TEST( MovFileBytes, AMovieWithoutSoundAndFramesIsWhole )
{
  VSmallMovie Movie( VMovieSettings::Silent() );
  ASSERT_TRUE( Movie.Begin() && Movie.m_Writer.Close() );
  const auto Parser = Movie.Parse();
  EXPECT_EQ( Parser.Root().Tree(),
    "ftyp mdat moov(mvhd "
    "trak(tkhd tapt(clef prof enof) edts(elst) tref(sync tmcd) mdia(mdhd hdlr minf(vmhd hdlr dinf(dref) stbl(stsd stts stsc stsz co64)))) "
    "trak(tkhd edts(elst) mdia(mdhd hdlr minf(gmhd(gmin tmcd(tcmi)) nmhd hdlr dinf(dref) stbl(stsd stts stsc stsz co64))))) TMSL" );
  // Names the audio track all the same.
  EXPECT_EQ( Parser.Number( Parser.Root().Child( "moov" ).Child( "trak" ).Child( "tref" ).Child( "sync" ), 0 ), 2u );
  EXPECT_EQ( Parser.Root().Child( "mdat" ).m_End - Parser.Root().Child( "mdat" ).m_Position, 20u );
  EXPECT_TRUE( Parser.Track( "vide" ).m_Samples.empty() );
  EXPECT_EQ( Parser.Body( SampleTable( Parser, 0 ).Child( "stsz" ) ), VBytes( 12 ) );
}

// The older form of the entry ends before the fields that its version promises.
TEST( MovFileBytes, SoundOf8BitIsRaw )
{
  VMovieSettings Settings;
  Settings.m_Audio = { IAudioSampleFormat::EUInt8, 48000, 2 };
  VSmallMovie Movie( Settings );
  ASSERT_TRUE( Movie.Begin() && Movie.Frame( VBytes( 16 ), VBytes( 6 ) ) && Movie.m_Writer.Close() );
  const auto Parser = Movie.Parse();
  VBigEndian Entry;
  Entry.U32( 0 ).U32( 1 ).Atom( 36, "raw " ).Zeros( 8 );
  Entry.U16( 2 ).Zeros( 6 ).U16( 2 ).U16( 8 ).U16( 0 ).U16( 0 ).U32( 48000u << 16 );   // version, channels, bits, rate
  ExpectSameBytes( Parser.Body( SampleTable( Parser, 1 ).Child( "stsd" ) ), Entry.m_Bytes );
  EXPECT_EQ( Parser.Track( "soun" ).m_Samples.at( 0 ).m_Count, 3u );
}
