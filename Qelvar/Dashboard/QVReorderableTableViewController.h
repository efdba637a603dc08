#pragma once

#include <QImage>
#include <QRectF>
#include <functional>
#include <memory>
#include <optional>

#include "Platform/Screen.h"
#include "Qelvar/Charts/QVAnimation.h"
#include "Qelvar/Dashboard/QVTableGeometry.h"

class QVReorderableTableViewController;

/// Whose rows change places. Told on the main thread.
class QVReorderableTableViewControllerDelegate {
 public:
    virtual ~QVReorderableTableViewControllerDelegate() = default;
    /// The row is a placeholder from now on: its content is what is dragged.
    virtual void reorderingDidBegin(QVReorderableTableViewController& controller, int row) = 0;
    /// The rows change places with each other; with a fast finger they need not be neighbours.
    virtual void rowDidMove(QVReorderableTableViewController& controller, int fromRow, int toRow) = 0;
    /// There is no placeholder any more, and the order stays.
    virtual void reorderingDidFinish(QVReorderableTableViewController& controller) = 0;
};

/// A table screen whose rows are put in another order by pressing, holding and dragging them, or one place at
/// a time by the keyboard. Here is all that a drag computes; the layout tells what the table looks like and
/// what pointer and frames do, and shows the dragging view. Main thread only.
class QVReorderableTableViewController : public platform::Screen {
    Q_OBJECT
    /// A row hangs on the pointer.
    Q_PROPERTY(bool dragging READ isDragging NOTIFY draggingChanged)
    /// Something is on its way: call advanceFrame() before each frame.
    Q_PROPERTY(bool moving READ isMoving NOTIFY movingChanged)
 public:
    /// A row's picture that follows the pointer. The rectangle is that of the visible part of the table,
    /// before the scale is applied about its centre.
    struct DraggingView {
        QImage image;
        QRectF frame;
        double scale = 1, opacity = 1;
    };

    /// How opaque the dragging view is while it is held. At first 1.
    double draggingViewOpacity() const { return draggingViewOpacity_; }
    void setDraggingViewOpacity(double opacity) { draggingViewOpacity_ = opacity; }
    std::shared_ptr<QVReorderableTableViewControllerDelegate> delegate() const { return delegate_.lock(); }
    void setDelegate(std::weak_ptr<QVReorderableTableViewControllerDelegate> delegate) {
        delegate_ = std::move(delegate);
    }

    bool isDragging() const { return phase_ == Phase::Dragging; }
    bool isMoving() const { return moving_; }
    /// Where the dragged row's placeholder is now; none: no drag.
    std::optional<int> currentRow() const { return currentRow_; }
    /// Points a frame, signed; 0: the table stands still.
    double scrollSpeed() const { return scrollSpeed_; }
    /// None: nothing is dragged, and nothing is on its way back.
    std::optional<DraggingView> draggingView() const;

    // What the layout tells. Heights of the pointer are those in the visible part of the table.

    /// Begins a drag of the row there. False: there is none.
    Q_INVOKABLE bool pressAndHoldBegan(double y);
    Q_INVOKABLE void pressAndHoldChanged(double y);
    /// The finger was lifted, or its touch was taken away: the row settles where its placeholder is.
    Q_INVOKABLE void pressAndHoldEnded();
    /// The user does not want it: the rows go back to where they were.
    Q_INVOKABLE void cancelReordering();
    /// Ends a drag at once, without animation: nobody is looking any more.
    Q_INVOKABLE void finishReordering();
    /// Moves a row some places, without a drag. False: there is no such place, and nothing happens.
    Q_INVOKABLE bool moveRow(int row, int places);
    /// The row at a height; -1: none.
    Q_INVOKABLE int rowAt(double y) const;
    Q_INVOKABLE void setTableGeometry(double width, double visibleHeight, double headerHeight,
                                      double rowHeight, double bottomInset);
    /// The table was scrolled to this offset.
    Q_INVOKABLE void tableDidScroll(double contentOffset);
    Q_INVOKABLE void advanceFrame() { advance(now()); }

    QVTableGeometry tableGeometry() const;
    /// Moves what is on its way to a time.
    void advance(QVAnimationTime now);
    /// At first the time since the machine's start.
    void setAnimationClock(std::function<QVAnimationTime()> clock) { clock_ = std::move(clock); }

 signals:
    void draggingChanged();
    void movingChanged();
    void draggingViewChanged();
    /// The table is to be scrolled to this offset now.
    void scrollRequested(double contentOffset);

 protected:
    QVReorderableTableViewController();

    virtual int numberOfRows() const = 0;
    /// What the row shows, on nothing.
    virtual QImage snapshotOfRow(int row) = 0;
    /// Hooks around a drag.
    virtual void willBeginReordering() {}
    virtual void didEndReordering() {}
    void setReordering(bool reordering);
    /// Puts the rows back in the order before the drag and tells rowsDidChange().
    virtual void restoreRows() = 0;
    /// The rows changed by other means while one of them is dragged, which is here now. None: it is gone, and
    /// the drag is over.
    void rowsDidChange(std::optional<int> currentRow);
    /// The geometry changed: the table is laid out.
    virtual void tableDidLayOut() {}
    /// Scrolls the table. REQUIRES: no drag.
    void scrollTo(double contentOffset);

 private:
    /// Settling: back onto the row. Leaving: the row shows itself again beneath what was dragged.
    enum class Phase { Idle, Dragging, Settling, Leaving };

    QVAnimationTime now() const { return clock_(); }
    double touchY() const { return touch_ + geometry_.contentOffset; }
    void liftRow(int row, QVAnimationTime now);
    void followTouch();
    void settle();
    void autoScroll(QVAnimationTime now);
    void place(const std::function<void()>& change);
    void finish();
    void setPhase(Phase phase);
    void updateMoving();

    std::weak_ptr<QVReorderableTableViewControllerDelegate> delegate_;
    double draggingViewOpacity_ = 1;
    std::function<QVAnimationTime()> clock_;
    QVTableGeometry geometry_;  // but the number of rows

    Phase phase_ = Phase::Idle;
    bool moving_ = false;
    std::optional<int> currentRow_;
    double touch_ = 0;  // in the visible part of the table
    double scrollSpeed_ = 0;
    std::optional<QVAnimationTime> lastScroll_;
    bool placing_ = false;  // the table is being told where its rows are

    QImage image_;
    /// The dragging view's centre is where the touch has it, and besides as far away as is left of the way
    /// that it has to go from or to its row.
    double centerY_ = 0;
    QVAnimatedNumber remainingWay_, scale_, opacity_, leaving_;
};
