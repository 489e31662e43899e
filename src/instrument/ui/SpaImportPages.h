// SPDX-License-Identifier: Apache-2.0
#pragma once

class CWidgetConstellation;
class CWidgetIQTrace;
class CWidgetSpectrum;
class QComboBox;
class QDialog;
class QLabel;
class QLineEdit;
class QPlainTextEdit;
class QPushButton;
class QRadioButton;
class QStackedWidget;
class QTextEdit;
class QtNumericEdit;
class QtProgressWidget;

/// The widgets of DlgSpaImport, made and laid out in its window, which owns them. They stand in
/// the order of the pages.
struct SpaImportPages
{
    explicit SpaImportPages(QDialog &window);

    QStackedWidget *sw_assist;

    QComboBox *cb_device;
    QComboBox *cb_input;
    QtNumericEdit *le_samplerate;
    QRadioButton *rb_samples;
    QtNumericEdit *le_samples;
    QRadioButton *rb_time;
    QtNumericEdit *le_time;
    QtNumericEdit *le_rbw;
    QtNumericEdit *le_pretrigger;
    QComboBox *cb_triggersource;
    QComboBox *cb_triggerslope;
    QtNumericEdit *le_triggerlevel;

    QTextEdit *te_capture;
    QtProgressWidget *w_progress;
    QPushButton *pb_capture;
    QPushButton *pb_abort;

    QRadioButton *rb_iq;
    QRadioButton *rb_spectrum;
    QRadioButton *rb_constellation;
    QStackedWidget *sw_preview;
    CWidgetIQTrace *w_iq;
    CWidgetSpectrum *w_spectrum;
    CWidgetConstellation *w_constellation;
    QLabel *l_preview;
    QRadioButton *rb_sc_no;
    QRadioButton *rb_sc_down;
    QRadioButton *rb_sc_auto;

    QLineEdit *le_outfile;
    QPushButton *pb_outfile;
    QPlainTextEdit *te_comment;
    QLineEdit *le_copyright;
    QtNumericEdit *le_clockrate;

    QTextEdit *te_result;

    QPushButton *pb_prev;
    QPushButton *pb_next;
    QPushButton *cb_close;

private:
    void addSettingsPage();
    void addCapturePage();
    void addPreviewPage();
    void addOutputPage();
    void addResultPage();
};
