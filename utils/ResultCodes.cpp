#include "utils/ResultCodes.h"

#include <unordered_map>

namespace ZOL
{
  namespace
  {
    struct VResultRow
    {
      ResultCode Code;
      const char* Message;
    };

    constexpr VResultRow s_ResultRows[] = {
        { 0x0, "Ok: The function succeeded" },
        { 0x1, "OkButNoEffect: The function succeeded but had no effect" },
        { 0x2, "OkButPartial: The function succeeded but was only partially applicable" },
        { 0x3, "OkButFinished: Successfully finished - no further operation possible" },
        { 0x4, "OkButModified: The function succeeded but one or more values or parameters were modified" },
        { 0x80000000u, "Failed: The function failed" },
        { 0x80000001u, "FailedWithException: The function generated an exception" },
        { 0x80000002u, "Finished: The service requested has finished" },
        { 0x80000003u, "Stopping: The service requested is stopping" },
        { 0x80000004u, "NotImplemented: The function is not implemented in this version" },
        { 0x80000005u, "NotSupported: The function is not supported" },
        { 0x80000006u, "NotPermitted: The function is not permitted at this time" },
        { 0x80000007u, "NotAvailable: The information requested was not available" },
        { 0x80000008u, "NotConnected: The required connection is not present" },
        { 0x80000009u, "NotSet: The requested information has not been set" },
        { 0x8000000Au, "NotFound: The requested information, instance or type was not found" },
        { 0x8000000Bu, "NotRequired: The action requested is not necessary" },
        { 0x8000000Cu, "AlreadyPresent: The data or item being set was already present" },
        { 0x8000000Du, "AlreadyInProgress: The operation requested is already in progress" },
        { 0x8000000Eu, "AlreadySet: The data or item being set is already set" },
        { 0x8000000Fu, "InvalidArgument: A supplied argument was invalid" },
        { 0x80000010u, "InvalidIndex: A supplied index was invalid or out of range" },
        { 0x80000011u, "InvalidName: A supplied name was invalid or unrecognized" },
        { 0x80000012u, "InvalidId: A supplied id was invalid or unrecognized" },
        { 0x80000013u, "InvalidHandle: A supplied handle was invalid" },
        { 0x80000014u, "InvalidToken: A supplied token was invalid" },
        { 0x80000015u, "InvalidPointer: A supplied pointer was invalid" },
        { 0x80000016u, "InvalidFormat: The data provided or requested was not in the expected format" },
        { 0x80000017u, "InvalidType: An incorrect type was provided" },
        { 0x80000018u, "InvalidVersion: An object or file was the wrong version" },
        { 0x80000019u, "InvalidSession: The session specified was not valid" },
        { 0x8000001Au, "InvalidInfo: The information supplied was not valid" },
        { 0x8000001Bu, "InvalidValue: A value supplied was not valid" },
        { 0x8000001Cu, "InvalidSettings: The settings supplied were not valid" },
        { 0x8000001Du, "ProtocolFailure: A protocol error was detected" },
        { 0x8000001Eu, "NetworkFailure: A network error occurred" },
        { 0x8000001Fu, "AllocationFailure: Failed to allocate memory or item" },
        { 0x80000020u, "SerialisationFailure: Failed during serialization/deserialization of data" },
        { 0x80000021u, "FileIOFailure: An operation to read or write a file failed" },
        { 0x80000022u, "TimedOut: The operation timed out" },
        { 0x80000023u, "WouldBlock: The operation failed as it would have had to block" },
        { 0x80000024u, "EndOfData: The operation failed as the end of a data stream has been reached" },
        { 0x80000025u, "Conflict: The operation detected a conflict" },
        { 0x80000026u, "FileNotOpen: The file is not open or could not be opened" },
        { 0x80000027u, "ShuttingDown: The operation failed because the component is shutting down" },
        { 0x80000028u, "DiskFull: No space left on device" },
        { 0x80000029u, "Canceled: The operation has been canceled" },
        { 0x8000002Au, "FileNotFound: The file does not exist or is unreadable" },
        { 0x80010000u, "RPCUnknown: The specified remote function or callback is not known" },
        { 0x80010001u, "RPCFailed: The remote function or callback invocation could not be invoked" },
        { 0x80010002u, "RPCInvalid: The remote function or callback invocation was badly formed or otherwise invalid" },
        { 0x80010003u, "RPCNotConnected: The connection to the remote function or callback is not open" },
        { 0x40000u, "Upload in progress" },
        { 0x40001u, "Download in progress" },
        { 0x40002u, "Bundle installing" },
        { 0x40003u, "IP address has changed" },
        { 0x80040000u, "Bad bundle filename" },
        { 0x80040001u, "Bundle in use" },
        { 0x80040002u, "Bundle being modified" },
        { 0x80040003u, "Bundle extraction failed" },
        { 0x80040004u, "Failed to find capture information" },
        { 0x80040005u, "Get capture error" },
        { 0x80040006u, "Get capture write error" },
        { 0x80040007u, "Bundle already installed" },
    };
    static_assert( sizeof( s_ResultRows ) / sizeof( s_ResultRows[0] ) == 64, "the result table has 64 rows" );
  } // namespace

  const std::string& GetResultText( ResultCode i_Code )
  {
    // Built once; never changed afterwards, so lookups need no lock.
    static const std::unordered_map< ResultCode, std::string > s_Texts = []
    {
      std::unordered_map< ResultCode, std::string > Texts;
      for( const VResultRow& rRow : s_ResultRows )
        Texts.emplace( rRow.Code, rRow.Message );
      return Texts;
    }();
    static const std::string s_Unknown = "Unknown result code";
    const auto It = s_Texts.find( i_Code );
    return It != s_Texts.end() ? It->second : s_Unknown;
  }
} // namespace ZOL
