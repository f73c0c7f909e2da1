#pragma once

#include <Flow2Graphics/CameraContributions.h>

#include <ZEK/Callback.h>

#include <QtCore/QObject>
#include <QtCore/QTimer>
#include <QtCore/QVariantList>

#include <atomic>
#include <functional>
#include <memory>
#include <mutex>
#include <string>
#include <vector>

namespace Flow2Graphics
{

/// What is told of the cameras that see the selection, or of what the selected cameras contribute to.
struct VContributionReport
{
  struct VRow
  {
    std::string Camera; ///< URN
    std::string Label;  ///< of the reconstruction; empty for one without a name
    std::uint32_t Reconstruction = 0, Id = 0;
    EContribution State = EContribution::Measured;
    double Error = 0; ///< px

    bool operator==( const VRow& i_rOther ) const;
  };
  struct VSeenBy
  {
    std::string Camera; ///< URN
    double Error = 0;   ///< the greatest that is known, px; no number where none is

    bool operator==( const VSeenBy& i_rOther ) const;
  };
  bool bOfCameras = false;            ///< cameras are selected, and no reconstruction
  std::size_t Selected = 0;           ///< reconstructions or cameras
  std::size_t Cameras = 0;            ///< all there are
  std::vector< VSeenBy > SeenBy;      ///< the cameras that see a selected reconstruction, all of them
  std::size_t Total = 0;              ///< rows that there would be without a limit
  std::vector< VRow > Rows;           ///< the greatest errors first; empty while nobody watches them
  std::vector< std::string > Missing; ///< what is selected but not in the frame, as sentences

  bool operator==( const VContributionReport& i_rOther ) const;
};

/// The answer to "Which cameras see this?" for documents and reports. Follows selection and frames while somebody
/// watches, at most ten times a second.
///
/// Thread: GUI, but for `Offer`, `IsWatched` and `AreRowsWatched`. Held by shared pointer.
class VContributions : public QObject, public std::enable_shared_from_this< VContributions >
{
  Q_OBJECT
  /// Each with "urn", "reconstruction", "id", "label", "error" (px; no value where it is not known), "errorText" and
  /// "color".
  Q_PROPERTY( QVariantList rows READ Rows NOTIFY Changed )
  Q_PROPERTY( bool ofCameras READ IsOfCameras NOTIFY Changed )
  Q_PROPERTY( int selected READ Selected NOTIFY Changed )
  Q_PROPERTY( QString summary READ Summary NOTIFY Changed )

public:
  /// `i_pPostal` null: what is offered is taken on the spot.
  explicit VContributions( std::shared_ptr< ZEK::IPostalService > i_pPostal );

  const QVariantList& Rows() const { return m_Rows; }
  bool IsOfCameras() const { return m_Shown.bOfCameras; }
  int Selected() const { return static_cast< int >( m_Shown.Selected ); }
  QString Summary() const;
  const VContributionReport& Shown() const { return m_Shown; }
  /// The greatest error of a camera that sees the selection, px; false for one that does not.
  bool OfCamera( const std::string& i_rURN, double& o_rError ) const;

  /// Whoever shows which cameras see the selection counts himself in and out.
  Q_INVOKABLE void watch();
  Q_INVOKABLE void unwatch();
  /// And whoever shows the rows too, in these instead.
  Q_INVOKABLE void watchRows();
  Q_INVOKABLE void unwatchRows();
  /// Takes at once what waits for its turn.
  void Flush();
  /// Is called when the first one begins to watch, and when the first one begins to watch rows.
  void SetOnWatched( std::function< void() > i_OnWatched ) { m_OnWatched = std::move( i_OnWatched ); }

  bool IsWatched() const { return m_Watchers.load( std::memory_order_relaxed ) > 0; }
  bool AreRowsWatched() const { return m_RowWatchers.load( std::memory_order_relaxed ) > 0; }
  /// Thread: any. Does nothing with what was offered before.
  void Offer( const VContributionReport& i_rReport );

signals:
  void Changed();

private:
  void Arrive();
  void Take();

  std::shared_ptr< ZEK::IPostalService > m_pPostal;
  std::atomic< int > m_Watchers{ 0 }, m_RowWatchers{ 0 };
  std::function< void() > m_OnWatched;
  QTimer m_Rest; ///< runs while it is too early to take another report
  std::mutex m_Guard;
  VContributionReport m_Offered;
  bool m_bPosted = false, m_bFresh = false;
  VContributionReport m_Shown;
  QVariantList m_Rows;
};

} // namespace Flow2Graphics
