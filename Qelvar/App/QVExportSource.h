#pragma once

#include <QString>
#include <filesystem>

/// What is shared of an export: the archive, whatever is done with it, under a subject. Plain value.
class QVExportSource {
 public:
    QVExportSource() = default;
    QVExportSource(std::filesystem::path url, QString subject)
        : url_(std::move(url)), subject_(std::move(subject)) {}

    const std::filesystem::path& url() const { return url_; }
    void setUrl(std::filesystem::path url) { url_ = std::move(url); }
    const QString& subject() const { return subject_; }
    void setSubject(const QString& subject) { subject_ = subject; }

    enum class Activity { Save, ShowInFolder, Mail };
    const std::filesystem::path& placeholderItem() const { return url_; }
    const std::filesystem::path& itemForActivityType(Activity) const { return url_; }
    const QString& subjectForActivityType(Activity) const { return subject_; }

 private:
    std::filesystem::path url_;
    QString subject_;
};
