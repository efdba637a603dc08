#pragma once

#include <vector>

#include "Qelvar/App/QVTransferController.h"

/// Asks, when the window is about to be closed while long work is under way, whether that is to be given up.
/// The sheet QVExportSheet.qml shows the question. Main thread only.
class QVQuitController final : public QVTransferController {
    Q_OBJECT
 public:
    /// REQUIRES: the works outlive this.
    explicit QVQuitController(std::vector<QVTransferController*> works);

    /// Whether the window may be closed now; where it may not the question is asked.
    bool mayQuit();
    bool isAsking() const { return asks_; }

    bool isWorking() const override { return false; }
    QString title() const override;
    QString message() const override;
    double fraction() const override { return -1; }
    QStringList buttonTitles() const override;
    Q_INVOKABLE void pressButton(int index) override;
    Q_INVOKABLE void leave() override { setAsks(false); }
    Q_INVOKABLE void cancel() override { setAsks(false); }

 signals:
    /// The person gives up what is under way.
    void quitRequested();

 protected:
    bool isThere() const override { return asks_; }

 private:
    bool anythingRuns() const;
    void setAsks(bool asks);

    const std::vector<QVTransferController*> works_;
    bool asks_ = false;
    bool givenUp_ = false;
};
