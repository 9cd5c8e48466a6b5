// The H.264 stream utilities on arbitrary bytes: the unit walks in both forms, the parameter
// set and SEI parsers, the dump, and the writer's round trip of every parameter set read.

#include "fileio/H264Utils/H264Utils.h"
#include "services/ILogCategorised.h"

#include "videointerface/BufferAllocators.h"

#include <cstdint>
#include <cstdlib>
#include <optional>
#include <sstream>
#include <vector>

namespace
{
  // A buffer over the fuzzer's bytes.
  class VInputBuffer : public ZOL::IBufferConst
  {
  public:
    VInputBuffer( const std::uint8_t* i_pData, std::size_t i_Size ) : m_pData( i_pData ), m_Size( i_Size ) {}
    const std::uint8_t* GetData() const override { return m_pData; }
    std::uint64_t GetSize() const override { return m_Size; }

  private:
    const std::uint8_t* m_pData;
    std::size_t m_Size;
  };

  void CheckUnit( const std::uint8_t* i_pUnit, std::uint64_t i_Size, std::optional< H264Utils::VH264SPS >& io_rSPS )
  {
    using namespace H264Utils;
    VH264SPS SPS;
    if( ParseSPS( i_pUnit, i_Size, SPS ) )
    {
      // What was read must write, and what was written must read.
      std::vector< std::uint8_t > Written;
      VH264SPS Again;
      if( !WriteSPS( SPS, Written ) || !ParseSPS( Written.data(), Written.size(), Again ) )
        std::abort();
      io_rSPS = SPS;
    }
    VH264PPS PPS;
    const VH264SPS* pSPS = io_rSPS ? &*io_rSPS : nullptr;
    if( ParsePPS( i_pUnit, i_Size, PPS, pSPS ) )
    {
      std::vector< std::uint8_t > Written;
      VH264PPS Again;
      if( !WritePPS( PPS, Written, pSPS ) || !ParsePPS( Written.data(), Written.size(), Again, pSPS ) )
        std::abort();
    }
    char SliceType = 0;
    (void)GetSliceType( i_pUnit, i_Size, SliceType );
    std::ostringstream Text;
    DescribeNALUnit( i_pUnit, i_Size, Text, 2, io_rSPS );
  }
} // namespace

extern "C" int LLVMFuzzerTestOneInput( const std::uint8_t* i_pData, std::size_t i_Size )
{
  using namespace H264Utils;
  static const auto s_pAllocator = std::make_shared< ZOL::VReaderBufferAllocator >();
  // Nothing on standard error, but every message is still formatted and delivered.
  static const int s_Sink = ( ZOL::GlobalLog().SetStandardErrorLevel( 0 ),
                              ZOL::GlobalLog().AddSink( []( const ZOL::ILogRecord& ) {}, ZOL::LogDetail ) );
  (void)s_Sink;
  // Access units of small pictures; larger inputs only slow the search down.
  if( i_Size > 256 * 1024 )
    return 0;
  const VInputBuffer Input( i_pData, i_Size );
  std::optional< VH264SPS > SPS;
  ForEachNALUnit( i_pData, i_Size, EH264StreamForm::AnnexB,
                  [&]( const std::uint8_t* i_pUnit, std::uint64_t i_Length )
                  {
                    CheckUnit( i_pUnit, i_Length, SPS );
                    return true;
                  } );
  // The same bytes as one unit without a start code, and as a length-prefixed sample.
  CheckUnit( i_pData, i_Size, SPS );
  (void)ContainsNALUnit( Input, H264NALUnitType_CodedSliceIDR, EH264StreamForm::AnnexB );
  (void)ContainsNALUnit( Input, H264NALUnitType_SPS );
  char SliceType = 0;
  (void)IsSingleSlice( Input, SliceType );
  std::shared_ptr< ZOL::IBuffer > pConverted;
  (void)LengthPrefixedToAnnexB( i_pData, i_Size, pConverted, *s_pAllocator );
  if( AnnexBToLengthPrefixed( i_pData, i_Size, pConverted, *s_pAllocator ) && pConverted )
  {
    std::shared_ptr< ZOL::IBuffer > pBack;
    if( !LengthPrefixedToAnnexB( pConverted->GetData(), pConverted->GetSize(), pBack, *s_pAllocator ) )
      std::abort();
  }
  return 0;
}
