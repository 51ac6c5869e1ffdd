#pragma once

#include <string>

#include "actions/uActionContext.h"

/// The one-line descriptions of the steps in the host's list. They show the stored texts as they
/// are, variables unexpanded. `Descr` comes in with the action's name and leaves with the line.
namespace zm {

void DescribeOpenImage(const IStepParams& params, std::u16string& Descr);
void DescribeSaveImage(const IStepParams& params, std::u16string& Descr);
void DescribeResizeImage(const IStepParams& params, std::u16string& Descr);
void DescribeCropImage(const IStepParams& params, std::u16string& Descr);
void DescribeRotateImage(const IStepParams& params, std::u16string& Descr);
void DescribeTextOnImage(const IStepParams& params, std::u16string& Descr);
void DescribeImageOnImage(const IStepParams& params, std::u16string& Descr);
void DescribeAddBorder(const IStepParams& params, std::u16string& Descr);

/// Text in single quotes, inner ones doubled.
std::u16string QuotedString(std::u16string_view text);

}  // namespace zm
