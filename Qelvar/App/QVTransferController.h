#pragma once

#include <QObject>
#include <QString>
#include <QStringList>

/// A long piece of work of the window, an import or an export: shown in a sheet, or put aside, so that the
/// window can be used meanwhile; then a row above the tabs says how far it is and brings the sheet back. Main
/// thread only.
class QVTransferController : public QObject {
    Q_OBJECT
    Q_PROPERTY(bool isShown READ isShown NOTIFY changed)
    Q_PROPERTY(bool isAside READ isAside NOTIFY changed)
    Q_PROPERTY(bool isWorking READ isWorking NOTIFY changed)
    Q_PROPERTY(QString title READ title NOTIFY changed)
    Q_PROPERTY(QString message READ message NOTIFY changed)
    Q_PROPERTY(double fraction READ fraction NOTIFY changed)
    Q_PROPERTY(QString progressText READ progressText NOTIFY changed)
    Q_PROPERTY(QString statusText READ statusText NOTIFY changed)
    Q_PROPERTY(QStringList buttonTitles READ buttonTitles NOTIFY buttonsChanged)
 public:
    /// In its sheet.
    bool isShown() const { return isThere() && !aside_; }
    bool isAside() const { return isThere() && aside_; }
    /// It runs, and would be lost at the window's end.
    virtual bool isWorking() const = 0;
    virtual QString title() const = 0;
    virtual QString message() const = 0;
    /// How far the work is, 0 to 1; -1: there is none, or it is not known.
    virtual double fraction() const = 0;
    /// The same as a text: "45%"; empty where it is not known.
    QString progressText() const;
    /// "Preparing Export, 45%": what it is called where its value cannot be told otherwise.
    QString statusText() const;
    virtual QStringList buttonTitles() const = 0;

    Q_INVOKABLE virtual void pressButton(int index) = 0;
    /// The user leaves without a choice (Escape, Back): what runs, or would be lost, is put aside, all else
    /// is closed.
    Q_INVOKABLE virtual void leave() = 0;
    Q_INVOKABLE virtual void cancel() = 0;
    /// Nothing where there is nothing to put aside, or to show.
    Q_INVOKABLE void putAside() { setAside(true); }
    Q_INVOKABLE void show() { setAside(false); }

 signals:
    void changed();
    void buttonsChanged();

 protected:
    explicit QVTransferController(QObject* parent = nullptr) : QObject(parent) {}
    /// There is something to show.
    virtual bool isThere() const = 0;
    void setAside(bool aside);
    /// What comes next is shown again.
    void forgetAside() { aside_ = false; }

 private:
    bool aside_ = false;
};
