#include "fileio/ImageSequenceIO/SequenceDescriptor.h"

#include "utils/UtilsIO/VLargeFile.h"
#include "videointerface/AttributeRecords.h"

namespace ImageSequenceIO
{
  const char* const FileNamePatternKey = "ImageSequenceInfo.FileNamePattern";
  const char* const FrameIndexPadWidthKey = "ImageSequenceInfo.FrameIndexPadWidth";
  const char* const FrameNumberPadWidthKey = "ImageSequenceInfo.FrameNumberPadWidth";
  const char* const FrameCountKey = "ImageSequenceInfo.FrameCount";

  bool ReadSequenceInfo( const ZOL::IVideoAttributes& i_rStore, VSequenceInfo& io_rInfo )
  {
    return i_rStore.Get( FileNamePatternKey, io_rInfo.FileNamePattern ) &&
           i_rStore.Get( FrameIndexPadWidthKey, io_rInfo.FrameIndexPadWidth ) &&
           i_rStore.Get( FrameNumberPadWidthKey, io_rInfo.FrameNumberPadWidth ) &&
           i_rStore.Get( FrameCountKey, io_rInfo.FrameCount );
  }

  void WriteSequenceInfo( ZOL::IVideoAttributes& io_rStore, const VSequenceInfo& i_rInfo )
  {
    io_rStore.Set( FileNamePatternKey, i_rInfo.FileNamePattern );
    io_rStore.Set( FrameIndexPadWidthKey, i_rInfo.FrameIndexPadWidth );
    io_rStore.Set( FrameNumberPadWidthKey, i_rInfo.FrameNumberPadWidth );
    io_rStore.Set( FrameCountKey, i_rInfo.FrameCount );
  }

  bool ReadDescriptor( ZOL::IInputStream& i_rStream, ZOL::IVideoAttributes& o_rFrameKeys,
                       ZOL::IVideoAttributes& o_rAttributes )
  {
    o_rAttributes.Clear();
    return o_rFrameKeys.ReadFrom( i_rStream ) && o_rAttributes.ReadFrom( i_rStream );
  }

  bool MakeDescriptorStores( const VDescriptor& i_rDescriptor, ZOL::IVideoAttributes& o_rFrameKeys,
                             ZOL::IVideoAttributes& o_rAttributes )
  {
    o_rFrameKeys.Clear();
    o_rAttributes = i_rDescriptor.Attributes;
    if( !ZOL::WriteVideoFrameInfo( o_rFrameKeys, i_rDescriptor.FrameInfo ) ||
        !ZOL::WriteVideoTiming( o_rAttributes, i_rDescriptor.Timing ) ||
        !ZOL::WriteVideoSettings( o_rAttributes, "", i_rDescriptor.Settings ) )
      return false;
    if( i_rDescriptor.Timecode.Standards != ZOL::TimecodeStandard_None &&
        !ZOL::WriteTimecode( o_rAttributes, i_rDescriptor.Timecode ) )
      return false;
    WriteSequenceInfo( o_rAttributes, i_rDescriptor.Sequence );
    return true;
  }

  bool WriteDescriptor( const std::string& i_rPath, const VDescriptor& i_rDescriptor )
  {
    ZOL::IVideoAttributes FrameKeys;
    ZOL::IVideoAttributes Attributes;
    if( !MakeDescriptorStores( i_rDescriptor, FrameKeys, Attributes ) )
      return false;
    UtilsIO::VLargeFile File;
    if( !File.Open( i_rPath, UtilsIO::OpenMode_Write ) )
      return false;
    const bool bWritten = FrameKeys.WriteTo( File ) && Attributes.WriteTo( File ) && File.Flush();
    return File.Close() && bWritten;
  }
} // namespace ImageSequenceIO
