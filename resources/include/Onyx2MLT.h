// Macros for the Onyx2 brick's music: include with #include <Onyx2MLT.h>.
//
// bb_PlayNote plays one note: freq in Hz, duration in 1/100 s, volume 0 to 100.
#define bb_PlayNote(freq,duration,volume) { tone freq, duration, volume }

// bb_Rest keeps silent for duration 1/100 s.
#define bb_Rest(duration) { wait duration }

// Notes of the fourth octave, in Hz.
#define NOTE_C4 262
#define NOTE_D4 294
#define NOTE_E4 330
#define NOTE_F4 349
#define NOTE_G4 392
#define NOTE_A4 440
#define NOTE_B4 494
#define NOTE_C5 523
