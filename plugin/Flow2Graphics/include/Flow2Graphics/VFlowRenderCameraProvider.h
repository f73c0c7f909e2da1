#pragma once

#include <Flow2Graphics/IFlowRenderType.h>
#include <Flow2Graphics/VFlowRenderCamera.h>

#include <Flow2TypesUtils/TaggedCoreTypeExtractor.h>
#include <MoxelGraphics/VSelectionRegistry.h>
#include <ZEK/RenderCamera.h>

#include <array>
#include <cstdint>
#include <memory>
#include <string>
#include <unordered_map>
#include <vector>

namespace MoxelGraphics
{
class VMoxelScene;
}

namespace Flow2Graphics
{

/// The members of one kind of all cameras of a frame, as one range of selection ids.
class VCameraMembers : public MoxelGraphics::IRangeResolver
{
public:
  struct VPart
  {
    VFlowRenderCamera* pCamera = nullptr;
    std::uint32_t First = 0;
  };
  VCameraMembers( std::uint32_t i_Kind, const char* i_pWord )
    : m_Kind( i_Kind )
    , m_pWord( i_pWord )
  {
  }

  std::vector< VPart > Parts; ///< ascending by name and by first index
  std::uint32_t Count = 0;

  bool ResolveIndex( std::uint32_t i_Index, ZEK::VSelectionItem& o_rItem, std::string& o_rLabel ) const override;
  bool FindIndex( const ZEK::VSelectionItem& i_rItem, std::uint32_t& o_rIndex ) const override;
  void Clear();
  void Add( VFlowRenderCamera& i_rCamera, std::size_t i_Count );

private:
  std::uint32_t m_Kind;
  const char* m_pWord;
};

/// Owns all cameras and gives them what each frame of state has for them. A camera lives as long as its name is there,
/// or as long as somebody holds it.
///
/// Draws nothing. It stands in a scene's list before whatever draws cameras, and takes the selection ids of their
/// centroids and grey blobs. An unchanged frame costs a few comparisons for each tag; a camera of a changed frame
/// fourteen; neither allocates. The generation stays the same as long as all of what cameras give does.
/// Thread: render thread.
class VFlowRenderCameraProvider : public ZEK::IRenderCameraProvider, public IFlowRenderType
{
public:
  explicit VFlowRenderCameraProvider( MoxelGraphics::VMoxelScene& i_rScene );
  ~VFlowRenderCameraProvider() override;

  void Update( const ZEK::IFlowState& i_rState ) override;

  ZEK::VRenderCameraRef GetCamera( const std::string& i_rName ) const override;
  const std::vector< ZEK::VRenderCameraRef >& GetCameras() const override { return m_List; }
  std::uint64_t GetGeneration() const override { return m_Generation; }

  /// The same as what they are.
  const std::vector< std::shared_ptr< VFlowRenderCamera > >& FlowCameras() const { return m_Slots; }
  const VCameraColours& Colours() const { return *m_pColours; }

private:
  /// FNV-1a over the bytes.
  struct VNameHash
  {
    std::size_t operator()( const std::string& i_rName ) const
    {
      std::uint64_t Hash = 0xCBF29CE484222325u;
      for ( const char Byte : i_rName )
      {
        Hash = ( Hash ^ static_cast< unsigned char >( Byte ) ) * 0x100000001B3u;
      }
      return static_cast< std::size_t >( Hash );
    }
  };
  using VCameraMap = std::unordered_map< std::string, std::shared_ptr< VFlowRenderCamera >, VNameHash >;

  // Each true for a change.
  bool TakeSubjects( const ZEK::IFlowState& i_rState );
  bool TakeReconstructionLabels( const ZEK::IFlowState& i_rState );
  bool GiveMarks( bool i_bAll );
  bool GiveIds( bool i_bAll );
  void TakeNames();
  /// True when a camera changed in a way that a viewer can see.
  bool GiveItems( const ZEK::IFlowState& i_rState, bool i_bAll );
  void TellScene();

  MoxelGraphics::VMoxelScene& m_rScene;
  Flow2TypesUtils::VTaggedCoreTypeExtractor CameraExtractor;
  Flow2TypesUtils::VTaggedCoreTypeExtractor SubjectExtractor;
  VCameraMap Cameras;
  std::shared_ptr< VCameraColours > m_pColours = std::make_shared< VCameraColours >();
  std::vector< std::shared_ptr< VFlowRenderCamera > > m_Slots; ///< by slot of the join
  std::vector< ZEK::VRenderCameraRef > m_List;
  ZEK::VFlowItemRef m_ReconstructionLabels;
  bool m_bOtherLabels = false;         ///< than in the update before
  std::vector< VCameraMarks > m_Marks; ///< by slot, while marks are given
  std::uint64_t m_MarksGeneration = 0;
  std::uint64_t m_Generation = 0; ///< grows with each change
  VCameraMembers m_Centroids, m_Blobs;
  std::uint32_t m_FirstCentroid = 0, m_FirstBlob = 0;
};

} // namespace Flow2Graphics
