#pragma once

#include "VTileBatch.h"

namespace MoxelGraphics
{

/// The grey blobs of a set of cameras: a record a blob, one table of lines and the pixels, each copied once.
struct VGreyscaleSet final : VTileSet
{
  CoreGraphics::VDynamicBuffer Records, Words;
  CoreGraphics::VTexelBuffer Lines{ CoreGraphics::ETexelWords }, Pixels{ CoreGraphics::ETexelByte };
  std::size_t Total = 0;           ///< records
  std::uint64_t WordsSerial = 0;   ///< of the set, and
  std::uint64_t WordsProvider = 0; ///< generation of the provider that the words are of; 0: of none
};

class VGreyscaleBatch final : public VTileBatch
{
public:
  explicit VGreyscaleBatch( std::shared_ptr< const ZEK::IRenderCameraProvider > i_pProvider )
    : VTileBatch( std::move( i_pProvider ), true )
  {
  }
  /// How a record stands in its buffer, an instance a record.
  static const CoreGraphics::VVertexLayout& RecordLayout();
  static constexpr std::size_t RecordBytes = 16;
  /// The selection words of all records of the set, without those that the scene ignores.
  bool WriteWords( VGreyscaleSet& io_rSet, VMoxelScene& io_rScene, int i_Scheme );

protected:
  std::unique_ptr< VTileSet > MakeSet() const override { return std::make_unique< VGreyscaleSet >(); }
  bool Write( CoreGraphics::VRenderContext& io_rContext, VTileSet& io_rSet,
              std::span< const ZEK::VCameraLists2D > i_Lists ) override;

private:
  /// Gives each slot its records: as many cameras' as the device holds.
  void Count( CoreGraphics::VRenderContext& io_rContext, VGreyscaleSet& io_rSet,
              std::span< const ZEK::VCameraLists2D > i_Lists );
  static bool WriteTables( CoreGraphics::VRenderContext& io_rContext, VGreyscaleSet& io_rSet,
                           std::span< const ZEK::VCameraLists2D > i_Lists );

  std::vector< std::uint32_t > m_Words;
  bool m_bSaid = false; ///< that there was more than the device holds
};

/// The selection words of a camera's blobs, one a record.
void MakeBlobWords( const ZEK::IRenderCamera& i_rCamera, const ZEK::VGreyscaleData& i_rData, VMoxelScene& io_rScene,
                    std::vector< std::uint32_t >& o_rWords );

} // namespace MoxelGraphics
