/* Status codes returned by every twanlys export. 0 is success, negative values are errors,
 * positive values are warnings whose outputs stand. The numbers are fixed: hosts key their texts
 * on them. */
#ifndef TWANLYS_STATUS_H
#define TWANLYS_STATUS_H

#include <stdint.h>

typedef int32_t AnalysisStatus;

enum {
    NoErr = 0,
    OutOfMemoryErr = -20001, /* a working allocation, a table creation or a HostResizeBlock call failed */
    EqSamplesErr = -20002, /* two input arrays that must hold the same number of samples (x and y, x and weights) differ */
    EmptyArrayErr = -20003, /* an input array has no elements (count below 1) */
    NegativeSizeErr = -20004, /* a stored dimension or a requested count is negative */
    SamplesNotPositiveErr = -20005, /* number of samples below 1 where a single sample is legal (ramp pattern, end point excluded) */
    TooFewSamples2Err = -20006, /* fewer than 2 samples or points where 2 are the minimum */
    TooFewSamples3Err = -20007, /* fewer than 3 samples or points where 3 are the minimum */
    SizeMismatchErr = -20008, /* input arrays or matrices have sizes that do not fit each other */
    DivisorLeadingZeroErr = -20010, /* deconvolution operand longer than 8388608 samples or divisor invalid, or a Zak gather index negative */
    PeriodNotPositiveErr = -20011, /* period or frequency argument of a pattern is 0 or negative */
    DutyRangeErr = -20012, /* duty, delay or width argument of a pattern lies outside the pattern */
    WidthRangeErr = -20013, /* peak-detector width below 1 or not smaller than the number of samples */
    DelayWidthRangeErr = -20014, /* delay plus width of a pulse pattern exceed the number of samples */
    SampleIntervalErr = -20016, /* sampling interval dt is 0 or negative */
    IndexRangeErr = -20017, /* an index or shift argument lies outside the array */
    BoundsOrderErr = -20019, /* a lower bound exceeds its upper bound */
    CutoffAboveNyquistErr = -20020, /* a cut-off frequency exceeds half the sampling frequency */
    OrderNotPositiveErr = -20021, /* a filter, transform or spline order or length argument is below 1 */
    DecimationFactorErr = -20022, /* decimation factor below 1 or above the number of samples */
    CutoffInvalidErr = -20023, /* cut-off or sampling frequency is 0 or negative, or upper not above lower */
    RippleNotPositiveErr = -20024, /* pass-band ripple is 0 or negative */
    AttenuationNotPositiveErr = -20025, /* stop-band attenuation is 0 or negative */
    ZeroAmplitudeErr = -20026, /* an amplitude or width argument is exactly 0 */
    WindowSumZeroErr = -20027, /* a window's sum or scaling denominator is 0 so the window cannot be normalised */
    AttenuationBelowRippleErr = -20028, /* attenuation not greater than ripple */
    DesignParameterErr = -20031, /* an equiripple or narrowband design parameter is invalid, or the equiripple iteration failed */
    NegativeLengthErr = -20032, /* a design length argument is negative */
    EvenTapsErr = -20033, /* an even length was given where an odd length is required */
    NonPositiveDataErr = -20036, /* data must be above 0 but are not (logarithmic and power models) */
    PolyOrderErr = -20037, /* polynomial order or number of terms too large for the data */
    InnerDimensionErr = -20039, /* inner dimensions of a matrix product differ */
    NotSquareErr = -20040, /* a matrix must be square and is not */
    SingularMatrixErr = -20041, /* the matrix is singular */
    FactorLevelsErr = -20042, /* a factor has fewer than 2 levels */
    LevelMissingErr = -20043, /* a factor level has no observations */
    LevelRepeatErr = -20044, /* a cell of an analysis-of-variance design has no or too few observations */
    ObservationCountErr = -20045, /* number of observations does not equal the product of levels and repeats */
    DomainSingularityErr = -20046, /* a computed index or argument falls where the routine has no value: resampling factors with a common divisor or kept samples beyond the state, overflow in a complex special function */
    UnbalancedDesignErr = -20047, /* a design cell holds a different number of observations than required */
    RandomFactorErr = -20048, /* the random-factor selector of a single-repeat design is invalid */
    NotAscendingErr = -20049, /* x values are not strictly ascending, or a knot difference is 0 */
    ZeroDenominatorErr = -20050, /* rational interpolation met a zero denominator */
    SampleCountErr = -20052, /* a statistics routine received fewer samples than its minimum, or a degrees-of-freedom value below 1 */
    ProbabilityRangeErr = -20053, /* a probability or confidence level lies outside its range */
    MultipleRepeatedErr = -20055, /* more than one repeated abscissa, or table dimension below 2 */
    NegativeTableErr = -20056, /* a contingency table has a negative entry or dimension */
    StateSizeErr = -20058, /* a supplied filter state, coefficient count or output size does not fit */
    NegativeArgumentErr = -20059, /* a count or delay argument is negative */
    DivideByZeroErr = -20060, /* a division by a zero (real or complex) value would occur */
    InvalidSelectorErr = -20061, /* an enumerated selector argument lies outside its legal values */
    NoConvergenceErr = -20062, /* an iteration stopped at its limit without converging (outputs stand where stated) */
    TermsBelowOneErr = -20063, /* a size, taps or side-points argument is below 1 */
    NoPeakFoundErr = -20064, /* no usable peak or solution exists for the data */
    CoefLayoutErr = -20066, /* filter coefficient arrays do not have the cascade layout */
    NanInfErr = -20068, /* an input holds NaN or Infinity */
    TooFewSamples4Err = -20069, /* fewer than 4 samples where 4 are the minimum */
    BandStructureErr = -20070, /* band widths or generalised-problem dimensions invalid */
    NotPositiveDefiniteErr = -20071, /* a Cholesky pivot is 0 or negative */
    FactorisationFailedErr = -20073, /* a LAPACK driver reported a failure in its first stage */
    FactorisationFailed2Err = -20074, /* a LAPACK driver reported a failure in its second stage */
    BufferTooSmallErr = -20075, /* internal buffer or the resampler's capacity would be exceeded */
    ResampleSizeErr = -20076, /* requested resampling output size reaches the limit */
    NoSuchCaseErr = -20078, /* a special function has no value at this argument combination */
    IntervalOrderErr = -20101, /* lower limit of an interval exceeds its upper limit */
    NegativeOrderErr = -20103, /* polynomial order is negative */
    BoundsNanErr = -20104, /* an initial or bound array of a bounded fit is invalid */
    QuantileRangeErr = -20105, /* significance level outside 0 to 1 */
    AllZeroCoefErr = -20111, /* all coefficients of a polynomial are 0 */
    FftSizeErr = -20115, /* FFT size or block length is below 1 */
    NoRootErr = -20116, /* no root bracket was found */
    SpecialFunctionDomainErr = -20117, /* a complex special function lost all precision */
    WorkspaceAlreadyInitErr = -20120, /* Analysis Workspace initialise called while it exists */
    WorkspaceEnabledErr = -20121, /* Analysis Workspace reset or release called while it is enabled */
    WorkspaceNotInitErr = -20122, /* Analysis Workspace enable or disable called while it does not exist */
    WorkspaceInUseErr = -20123, /* Analysis Workspace release called with live blocks */
    WorkspaceWrongThreadErr = -20124, /* arena block requested by a thread that is not the registered one */
    WorkspaceExhaustedErr = -20126, /* arena has no room for the request (raised, caught at the arena allocator) */
    TooFewDataForModelErr = -20127, /* more parameters fixed or required than data */
    BadDataRangeErr = -20140, /* argument must be positive but is 0 or negative */
    DegenerateDataErr = -20141, /* data are all equal or too few distinct values */
    TooFewRepeatsErr = -20166, /* repeats below 2 in a three-way design */
    SlewRegionTooShortErr = -20308, /* too few crossings in the waveform for the requested pulse or transition number */
    LevelOrderErr = -20309, /* the waveform has no span: maximum not above minimum, or amplitude not above 0 */
    TransitionNotFoundErr = -20310, /* the requested transition number is beyond those found */
    MeasureNoMemoryErr = -20311, /* measurement working memory exhausted */
    MeasureEmptyWaveformErr = -20312, /* the waveform handed to a measurement has no samples */
    ReferenceOrderErr = -20313, /* reference levels are not in ascending order, or the hysteresis is negative */
    MeasureDtErr = -20315, /* the sampling interval of a measurement is 0 or negative */
    HistogramMethodErr = -20316, /* the state-level method selector of a histogram record is above 2 */
    HistogramSizeErr = -20317, /* the histogram size of a measurement record is below 1 */
    HistogramEmptyErr = -20319, /* a cycle starts at sample index 0 */
    MeasureEmptyErr = -20323, /* the requested pulse, transition or cycle number is below 1 */
    ReferenceUnitErr = -20326, /* transition duration is not above 0 */
    MeasureNullRecordErr = -20331, /* a required settings record of a measurement is absent (null pointer) */
    InternalErr = -20999, /* an internal consistency failure, a LAPACK argument error or an unsupported case */
    SpecialFunctionInputErr = -23039, /* a complex special function refused its input */
    RateStateSizeErr = -24034, /* multirate output size not equal to the size expected from the factor */
    RateStageErr = -24051, /* a multirate stage cannot run: its input and output are the same block, or its scratch memory is exhausted */
    RankDeficientWarn = 20001, /* a rank-revealing solve used fewer singular values than min(m, n); the minimum-norm solution stands */
    EmptyInputWarn = 20002, /* positive warning: empty input where an empty result is legal */
    SingularPivotWarn = 20003, /* an LU or tridiagonal factorisation met a zero pivot column; the factors stand */
    LengthsDifferWarn = 20004, /* positive warning: MSE_head received arrays of different lengths and used the shorter length */
    UndefinedEigenvalueWarn = 20005, /* a generalised eigenvalue has alpha = beta = 0 so the requested ordering was abandoned */
    MatrixFunctionAccuracyWarn = 20006, /* a matrix function result is the best found but did not reach its accuracy test */
    InitialLengthWarn = 20010, /* positive warning: an initial-guess array has neither 0 elements nor the model's parameter count; it is ignored when too short */
    StateLevelWeakWarn = 20021, /* positive warning: a state-level histogram bin holds fewer than 5 percent of the samples; levels stand */
    OrderClampedWarn = 20031, /* positive warning: a polynomial order above 25 was limited; coefficients above the limit are 0 */
    ResampleEmptyWarn = 24003, /* positive status of the resampler for an empty input */
};

#endif
