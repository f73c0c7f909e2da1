/* The generation lock of the store as a model: the fields and steps of GenerationLock.h and .cpp under their own names,
   one step a word that others see. A thread that would look again and again either sees at its one look what it waits
   for, or goes to sleep. A broadcast wakes only who sleeps at that moment, and the mutex is let go before it. The
   committed tree is two cells that a merge writes one after the other and that readers look at without the mutex.

   Check.sh runs it: safety with -DREADERS=2 -DWRITERS=2 -DROUNDS=2 and others, and with -DLIVE scopes without end, a
   fair mutex, and the claims that who waits gets in; numbers are then kept relative to the phase, so that there are
   finitely many. -DMUTANT=n seeds a mistake that the run must find:
     1 a reader does not look again after announcing       2 the commit does not look at the lines
     3 a late reader announces the phase before the commit  4 the phase moves on before the merge
     5 leaving a line wakes nobody                          6 a broadcast wakes one sleeper only
     7 announcing anew wakes nobody                         8 two writers may draw one number
     9 a late reader leaves its line before it announces   10 the phase moves on without the mutex */

#ifndef READERS
#define READERS 2
#endif
#ifndef WRITERS
#define WRITERS 2
#endif
#ifndef ROUNDS
#define ROUNDS 2
#endif
#ifndef MUTANT
#define MUTANT 0
#endif
#define THREADS (READERS + WRITERS)
#define IsCommit(phase) ((phase) % 2 != 0)

byte Phase = 2;
byte Line[READERS];           /* VReaderLine::m_Phase */
byte NextWriter = 1;
bool bDrainWaits;
bool DrainSleeps;             /* the one committer sleeps */
bool AdvanceSleeps[THREADS];
byte CellA, CellB;            /* the committed tree: the number of its last commit */
byte InWrite, Finished;
bool Waits[THREADS];          /* between the call of Begin and its end */
/* Of each thread: the phase that it saw or awaits. */
byte Saw[THREADS];

#ifdef LIVE
/* A fair mutex: who comes first is first. */
byte Head, Tail;
inline Lock() { d_step { ticket = Tail; Tail = (Tail + 1) % THREADS }; Head == ticket }
inline Unlock() { d_step { Head = (Head + 1) % THREADS; ticket = 0 } }
#define TURNS do :: true ->
#define TURNS_END od
/* Older than the phase is older, however much. */
#define Older(word) word = (word > 3 -> word - 2 : (word != 0 -> 1 : 0))
#else
bool Locked;
inline Lock() { atomic { !Locked -> Locked = true } }
inline Unlock() { Locked = false }
#define TURNS for ( round : 1 .. ROUNDS ) {
#define TURNS_END }
#endif

inline Broadcast() {
  d_step {
    i = 0;
    do
    :: i < THREADS ->
       if
       :: MUTANT == 6 && AdvanceSleeps[i] -> AdvanceSleeps[i] = false; break
       :: else -> AdvanceSleeps[i] = false
       fi;
       i++
    :: else -> break
    od;
    i = 0
  }
}

inline WakeDrain() {
  Lock(); Unlock();
  DrainSleeps = false
}

/* One look, then asleep under the mutex until the phase is there. */
inline AwaitPhase() {
  if
  :: Phase >= Saw[me]
  :: Phase < Saw[me] ->
     Lock();
     do
     :: Phase >= Saw[me] -> break
     :: Phase < Saw[me] ->
        atomic { AdvanceSleeps[me] = true; Unlock() };
        !AdvanceSleeps[me];
        Lock()
     od;
     Unlock()
  fi
}

/* The line is never empty meanwhile: no commit but the one under way can be over before the new word is there. */
inline BeginLate() {
  if
  :: MUTANT == 9 -> Line[me] = 0
  :: else
  fi;
  Saw[me] = Phase;
  if
  :: IsCommit( Saw[me] ) -> Saw[me] = (MUTANT == 3 -> Saw[me] - 1 : Saw[me] + 1)
  :: else
  fi;
  Line[me] = Saw[me];
  if
  :: bDrainWaits && MUTANT != 7 -> WakeDrain()
  :: else
  fi;
  AwaitPhase()
}

/* Line by line, as readers go on meanwhile. */
inline AnyBefore( result ) {
  result = false;
  i = 0;
  do
  :: i < READERS ->
     result = result || (Line[i] != 0 && Line[i] < Phase && MUTANT != 2);
     i++
  :: else -> break
  od;
  i = 0
}

proctype Reader( byte me ) {
  byte i, round, seen, ticket;
  TURNS
    /* BeginRead */
    atomic { Waits[me] = true; Saw[me] = Phase };
    Line[me] = Saw[me];
    if
    :: (Phase != Saw[me] || IsCommit( Saw[me] )) && MUTANT != 1 -> BeginLate()
    :: else
    fi;
    atomic { Waits[me] = false; Saw[me] = 0 };
#ifndef LIVE
    /* inside: the tree is the commit that Generation() says, from begin to end */
    seen = Phase / 2 - 1;
    assert( CellA == seen );
    assert( CellB == seen );
    assert( CellA == seen && Phase / 2 - 1 == seen );
#endif
    /* EndRead */
    Line[me] = 0;
    if
    :: bDrainWaits && MUTANT != 5 -> WakeDrain()
    :: else
    fi
  TURNS_END;
  Finished++
}

proctype Writer( byte me ) {
  byte i, round, number, ticket;
  bool reading;
  TURNS
    /* BeginWrite */
    if
    :: MUTANT != 8 -> d_step { Waits[me] = true; Saw[me] = 2 * NextWriter; NextWriter++ }
    :: MUTANT == 8 -> Saw[me] = 2 * NextWriter; NextWriter = Saw[me] / 2 + 1
    fi;
    AwaitPhase();
    d_step { Waits[me] = false; assert( InWrite == 0 ); InWrite++ };
#ifndef LIVE
    assert( Phase == Saw[me] && CellA == Phase / 2 - 1 && CellB == CellA );
#endif
    InWrite--;
    /* EndWrite: BeginCommit, one look at the lines without the mutex */
    Phase++;
    AnyBefore( reading );
    Lock();
    if
    :: reading ->
       bDrainWaits = true;
       do
       :: AnyBefore( reading );
          if
          :: !reading -> break
          :: else ->
             atomic { DrainSleeps = true; Unlock() };
             !DrainSleeps;
             Lock()
          fi
       od;
       bDrainWaits = false
    :: else
    fi;
    number = Phase / 2;
    assert( number == Saw[me] / 2 );
    if
    :: MUTANT == 4 -> Phase++
    :: else
    fi;
#ifdef LIVE
    d_step {
      Saw[me] = 0;
      for ( i : 0 .. READERS - 1 ) { Older( Line[i] ) };
      for ( i : 0 .. THREADS - 1 ) { Older( Saw[i] ) };
      NextWriter--;
      Phase--;
      number = 0;
      i = 0
    };
    Unlock();
#else
    /* the merge */
    CellA = number;
    CellB = number;
    if
    :: MUTANT == 10 -> Unlock(); Phase++
    :: MUTANT == 4 -> Unlock()
    :: else -> Phase++; Unlock()
    fi;
    Saw[me] = 0;
#endif
    Broadcast()
  TURNS_END;
  Finished++
}

init {
  byte p;
  atomic {
    for ( p : 0 .. READERS - 1 ) { run Reader( p ) };
    for ( p : READERS .. THREADS - 1 ) { run Writer( p ) };
    p = 0
  };
#ifndef LIVE
  Finished == THREADS;
  assert( Phase == 2 + 2 * WRITERS * ROUNDS && NextWriter == Phase / 2 && !bDrainWaits )
#endif
}

#ifdef LIVE
ltl ReaderGetsIn { [] <> !Waits[0] }
ltl WriterGetsIn { [] <> !Waits[READERS] }
#endif
