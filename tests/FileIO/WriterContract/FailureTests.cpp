// What the writers say, and what they leave behind, when the disk fails or memory runs out.
#include "tests/FileIO/WriterContract/ContractWriter.h"

#include <set>

namespace WriterContract
{

namespace
{

constexpr uint64_t Frames = 7;

// What became of a recording that met a fault.
struct VRun
{
  bool m_bHeader = false;
  bool m_bClosed = false;
  uint64_t m_Written = 0;   // frames whose call gave true
};

// Goes on after a failure, as no client would.
VRun Write( VContractWriter& io_rContract )
{
  VRun Run;
  Run.m_bHeader = io_rContract.Begin();
  bool bFailed = !Run.m_bHeader;
  for( uint64_t Frame = 0; Frame < Frames; ++Frame )
  {
    const bool bWritten = io_rContract.WriteFrame( Frame );
    EXPECT_FALSE( bFailed && bWritten ) << "frame " << Frame;
    Run.m_Written += bWritten;
    bFailed = bFailed || !bWritten;
  }
  Run.m_bClosed = io_rContract.Writer().Close();
  EXPECT_FALSE( io_rContract.Writer().IsOpen() );
  EXPECT_FALSE( io_rContract.Writer().Close() );
  return Run;
}

const VBytes& FileOf( const VContractWriter& i_rContract ) { return *i_rContract.Files().begin()->second; }

// A reader finds what was told to be written, nothing that was not, and hardly more. Gives whether the file has its tables.
bool CheckLeftBehind( VContractWriter& io_rContract, const VRun& i_rRun, const VWriterRow& i_rRow )
{
  const auto Found = i_rRow.m_Read( FileOf( io_rContract ) );
  const uint64_t Kept = i_rRun.m_Written - io_rContract.Writer().CountIncompleteFrames();
  if( !Found )
  {
    EXPECT_TRUE( !i_rRun.m_bHeader || !i_rRow.m_bReadableUnfinished );
    EXPECT_EQ( Kept, 0u );
    return false;
  }
  EXPECT_GE( Found->m_Frames.size(), Kept );
  EXPECT_LE( Found->m_Frames.size(), Kept + 1 );
  for( const auto& [Key, rFrame] : Found->m_Frames )
  {
    EXPECT_EQ( rFrame.m_Video, io_rContract.Picture( Key ) );
    EXPECT_TRUE( rFrame.m_Audio == io_rContract.Sound( Key ) || ( Key >= Kept && rFrame.m_Audio.empty() ) ) << "frame " << Key;
  }
  return Found->m_bFinished;
}

// Every offset, but for long stretches of zeros, where a place is like its neighbours, only some.
std::set<uint64_t> FaultOffsets( const VBytes& i_rFile )
{
  std::set<uint64_t> Offsets;
  for( uint64_t Offset = 0; Offset < i_rFile.size(); ++Offset )
  {
    if( Offset % 97 == 0 )
    {
      Offsets.insert( Offset );
    }
    if( i_rFile[Offset] != 0 )
    {
      Offsets.insert( { Offset - ( Offset != 0 ), Offset, std::min( Offset + 1, i_rFile.size() - 1 ) } );
    }
  }
  return Offsets;
}

}

TEST_P( FailingStream, ADiskThatIsFullAtAnyByteIsReportedAndLeavesNoWrongFrame )
{
  VContractWriter HeaderAlone( GetParam() );
  ASSERT_TRUE( HeaderAlone.Begin() );
  const uint64_t HeaderEnd = FileOf( HeaderAlone ).size();
  VContractWriter Whole( GetParam() );
  ASSERT_TRUE( Write( Whole ).m_bClosed );
  EXPECT_EQ( GetParam().m_Read( FileOf( Whole ) )->m_Frames.size(), Frames );
  const std::set<uint64_t> Offsets = FaultOffsets( FileOf( Whole ) );
  ASSERT_GT( Offsets.size(), 600u );
  for( const uint64_t Offset : Offsets )
  {
    SCOPED_TRACE( Offset );
    VContractWriter Contract( GetParam(), { .m_Offset = Offset } );
    const VRun Run = Write( Contract );
    EXPECT_EQ( Run.m_bHeader, Offset >= HeaderEnd );
    EXPECT_FALSE( Run.m_bClosed );
    EXPECT_LE( FileOf( Contract ).size(), Offset );
    CheckLeftBehind( Contract, Run, GetParam() );
  }
}

// Here the stream works again after the failure, so that only the writer's own memory keeps it.
TEST_P( FailingStream, AnyOperationThatFailsOnceIsNeverForgotten )
{
  VContractWriter Whole( GetParam() );
  ASSERT_TRUE( Write( Whole ).m_bClosed );
  ASSERT_GT( Whole.Operations(), Frames );
  for( uint64_t Operation = 0; Operation < Whole.Operations(); ++Operation )
  {
    SCOPED_TRACE( Operation );
    VContractWriter Contract( GetParam(), { .m_Operation = Operation } );
    const VRun Run = Write( Contract );
    EXPECT_FALSE( Run.m_bClosed );
    const bool bFinished = CheckLeftBehind( Contract, Run, GetParam() );
    EXPECT_TRUE( bFinished || !Run.m_bHeader || Run.m_Written == Frames ) << "the frames before a failed frame get their tables";
  }
}

TEST_P( WriterContract, EveryFailureIsToldAndNoExceptionLeavesAnOperation )
{
  const auto IsWritten = []( VContractWriter& io_rContract )
  {
    bool bWritten = io_rContract.Begin();
    bWritten = io_rContract.WriteFrame( 0 ) && bWritten;
    bWritten = io_rContract.Writer().Close() && bWritten;
    EXPECT_FALSE( io_rContract.Writer().IsOpen() );
    return bWritten;
  };
  VContractWriter Whole( GetParam() );
  ASSERT_TRUE( IsWritten( Whole ) );
  for( uint64_t Operation = 0; Operation < Whole.Operations(); ++Operation )
  {
    for( const bool bThrows : { false, true } )
    {
      VContractWriter Contract( GetParam(), { .m_Operation = Operation, .m_bThrows = bThrows } );
      EXPECT_FALSE( IsWritten( Contract ) ) << "operation " << Operation << ( bThrows ? " throws" : " fails" );
    }
  }
  const auto pWithoutFiles = GetParam().m_Make( {},
    []( const std::string& ) -> std::unique_ptr<UtilsIO::IClosableStream> { throw std::bad_alloc(); } );
  EXPECT_FALSE( pWithoutFiles->Open( "movie" ) && Whole.Header().WriteTo( *pWithoutFiles ) );
}

}
